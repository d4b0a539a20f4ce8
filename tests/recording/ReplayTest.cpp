#include "cli/replay/Replay.h"

#include <gtest/gtest.h>

#include "RecordingFixture.h"
#include "cli/UsageError.h"

namespace {

using Cli::RecordedSession;
using CloudTest::NEVER_SPEECH;
using CloudTest::SHORT_SPEECH;
using RecordingTest::Json;
using RecordingTest::Texts;
using Talvox::SessionRecording;
using Talvox::Settings;
using TestSupport::Answer;

class ReplayTest : public RecordingTest::RecordingFixture {
  protected:
    ReplayTest() { EXPECT_TRUE(record()); }

    /** Ends the recording and reads it. */
    RecordedSession finish() {
        session.reset();
        SessionRecording::stop();
        return Cli::readRecording(listRecordings().back());
    }

    RecordedSession recordAnswered() {
        startSession(SHORT_SPEECH);
        play(1100);
        EXPECT_TRUE(events->waitForEnds());
        return finish();
    }

    /** What a replay finds; it must have compared something. */
    static std::string findDifference(const RecordedSession& recorded) {
        const Cli::ReplayResult result = Cli::replay(recorded);
        EXPECT_GT(result.events, 0U);
        return result.difference;
    }

    static Json& find(RecordedSession& recorded, const char* name, const char* value,
                      std::size_t nth = 0) {
        for (Json& line : recorded.lines) {
            if (line.value(name, "") == value && nth-- == 0) {
                return line;
            }
        }
        throw std::runtime_error("no such line");
    }
};

TEST_F(ReplayTest, FindsAnAnsweredSessionEqual) {
    EXPECT_EQ(findDifference(recordAnswered()), "");
}

TEST_F(ReplayTest, FindsStreamedSpeexEqual) {
    configure([](Settings& settings) {
        settings.putBoolean(Settings::SKS_STREAMING, true);
        settings.putString(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
    });
    EXPECT_EQ(findDifference(recordAnswered()), "");
}

TEST_F(ReplayTest, FindsWholeSpeexEqual) {
    configureText(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
    EXPECT_EQ(findDifference(recordAnswered()), "");
}

TEST_F(ReplayTest, FindsASessionWithoutSpeechEqual) {
    startSession(NEVER_SPEECH);
    play(5100);
    EXPECT_EQ(events->texts().back(), "error ErrorNoVoice");
    EXPECT_EQ(findDifference(finish()), "");
}

TEST_F(ReplayTest, FindsATimeLimitEqual) {
    server.setDefaultAnswer(Answer::never());
    startSession(SHORT_SPEECH);
    play(1100);
    advanceMs(20000);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(findDifference(finish()), "");
}

TEST_F(ReplayTest, FindsARetryEqual) {
    server.script({Answer::status(503)});
    startSession(SHORT_SPEECH);
    play(1100);
    while (!events->waitForEnds(1, std::chrono::milliseconds(1))) {
        advanceMs(100);
    }
    EXPECT_EQ(events->texts().back(), "results");
    EXPECT_EQ(findDifference(finish()), "");
}

TEST_F(ReplayTest, FindsABrokenAnswerEqual) {
    server.setDefaultAnswer(Answer::closing());
    startSession(SHORT_SPEECH);
    play(1100);
    while (!events->waitForEnds(1, std::chrono::milliseconds(1))) {
        advanceMs(100);
    }
    EXPECT_EQ(events->texts().back(), "error ErrorNetwork");
    EXPECT_EQ(findDifference(finish()), "");
}

TEST_F(ReplayTest, MakesCallsFromInsideOfTheSameEvents) {
    configureText(Settings::SKS_VAD_SETTINGS, SHORT_SPEECH);
    const Texts names{"recordingBegin", "speakingBegin", "recordingDone",
                      "buffer",         "power",         "results"};
    for (const std::string& name : names) {
        for (const bool cancels : {true, false}) {
            makeSession();
            // By value: an end is waited for, not the hook behind it.
            events->hook = [name, cancels](const std::string& text,
                                           Talvox::Recognizer* recognizer) {
                if (text == name) {
                    cancels ? recognizer->cancel() : recognizer->stop();
                }
            };
            session->start();
            play(1100);
            ASSERT_TRUE(events->waitForEnds());
        }
    }
    session.reset();
    SessionRecording::stop();
    const Texts recordings = listRecordings();
    ASSERT_EQ(recordings.size(), 2 * names.size());
    for (const std::string& path : recordings) {
        EXPECT_EQ(findDifference(Cli::readRecording(path)), "") << path;
    }
}

TEST_F(ReplayTest, MakesTheRecorderFailInTheSamePlace) {
    prepareRecorder = [](CloudTest::ScriptedRecorder& made) { made.failsWhenStopped = true; };
    startSession(SHORT_SPEECH);
    play(1100);
    EXPECT_EQ(events->texts().back(), "error ErrorAudio");
    EXPECT_EQ(findDifference(finish()), "");
}

TEST_F(ReplayTest, SaysWhichEventIsAnother) {
    RecordedSession recorded = recordAnswered();
    find(recorded, "event", "results")["hypotheses"][0]["text"] = "go back";
    EXPECT_EQ(findDifference(recorded),
              "event 19 is results hypotheses=[\"go forward\",\"go for it\"] "
              "outcome=\"accepted\" requestId=\"request-1\" at 1100.000 ms; recorded: results "
              "hypotheses=[\"go back\",\"go for it\"] outcome=\"accepted\" "
              "requestId=\"request-1\" at 1100.000 ms");
}

TEST_F(ReplayTest, SaysWhichEventDoesNotCome) {
    RecordedSession recorded = recordAnswered();
    recorded.description["engine"]["vad"] = NEVER_SPEECH;
    EXPECT_EQ(findDifference(recorded).substr(0, 100),
              "event 3 does not come; recorded: speakingBegin at 400.000 ms");
}

TEST_F(ReplayTest, SaysThatAnEventIsTooMuch) {
    RecordedSession recorded = recordAnswered();
    recorded.description["engine"]["vad"] = CloudTest::ENDLESS_SPEECH;
    for (auto line = recorded.lines.begin(); line != recorded.lines.end(); ++line) {
        if (line->value("event", "") == "recordingBegin") {
            recorded.lines.erase(line);
            break;
        }
    }
    EXPECT_NE(findDifference(recorded).find("event 0 is recordingBegin at 300.000 ms; recorded: "
                                            "buffer at 400.000 ms"),
              std::string::npos);
}

TEST_F(ReplayTest, NoticesATimeThatIsAnother) {
    RecordedSession recorded = recordAnswered();
    find(recorded, "event", "speakingBegin")["t"] = 399999999;
    EXPECT_EQ(findDifference(recorded),
              "event 3 is speakingBegin at 400.000 ms; recorded: speakingBegin at 400.000 ms");
    find(recorded, "event", "speakingBegin")["t"] = 1400000001;
    EXPECT_NE(findDifference(recorded), "");
}

TEST_F(ReplayTest, NoticesAnotherLevel) {
    RecordedSession recorded = recordAnswered();
    Json& level = find(recorded, "event", "power", 2)["level"];
    level = level.get<float>() + 0.02F;
    EXPECT_NE(findDifference(recorded).find("is power level="), std::string::npos);
}

TEST_F(ReplayTest, RefusesEventsThatCannotBeCompared) {
    for (const Json& time : {Json("x"), Json(Json::array())}) {
        RecordedSession recorded = recordAnswered();
        find(recorded, "event", "speakingBegin")["t"] = time;
        EXPECT_THROW(Cli::replay(recorded), Cli::UsageError) << time;
    }
    RecordedSession recorded = recordAnswered();
    find(recorded, "event", "results")["hypotheses"] = Json::array({1});
    EXPECT_THROW(Cli::replay(recorded), Cli::UsageError);
}

TEST_F(ReplayTest, RefusesWhatIsNoRecording) {
    EXPECT_THROW(Cli::readRecording(scratch.path()), Cli::UsageError);
    RecordedSession recorded = recordAnswered();
    const std::string path = listRecordings().back();
    const std::string lines = scratch.read(path + "/events.jsonl");
    scratch.write("recordings/" + path.substr(folder().size() + 1) + "/events.jsonl",
                  lines + "{\"kind\":\"buf");
    EXPECT_EQ(Cli::readRecording(path).lines.size(), recorded.lines.size());
    scratch.write("recordings/" + path.substr(folder().size() + 1) + "/events.jsonl",
                  lines + "[]\n");
    EXPECT_THROW(Cli::readRecording(path), Cli::UsageError);
    recorded.sound.resize(100);
    EXPECT_THROW(Cli::replay(recorded), Cli::UsageError);
    find(recorded, "kind", "buffer")["offset"] = "x";
    EXPECT_THROW(Cli::replay(recorded), Cli::UsageError);
}

TEST_F(ReplayTest, RefusesARecordingWithoutSound) {
    EXPECT_TRUE(record(1000000, false));
    EXPECT_THROW(recordAnswered(), Cli::UsageError);
}

}  // namespace
