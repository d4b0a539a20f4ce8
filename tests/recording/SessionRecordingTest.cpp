#include "talvox/SessionRecording.h"

#include <gtest/gtest.h>
#include <sys/resource.h>

#include <boost/make_shared.hpp>
#include <cmath>
#include <csignal>
#include <thread>

#include "RecordingFixture.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "support/LogCapture.h"
#include "talvox/impl/recording/JsonObject.h"
#include "talvox/impl/recording/RecordingWriter.h"

namespace {

using CloudTest::getConstantBytes;
using CloudTest::SHORT_SPEECH;
using RecordingTest::Json;
using RecordingTest::Texts;
using Talvox::SessionRecording;
using TestSupport::Answer;
using TestSupport::LogCapture;

constexpr std::size_t WAV_HEAD_BYTES = 44;
constexpr std::size_t BUFFER_BYTES = 3200;

class SessionRecordingTest : public RecordingTest::RecordingFixture {
  protected:
    void runSession() {
        startSession(SHORT_SPEECH);
        play(1100);
        ASSERT_TRUE(events->waitForEnds());
        session.reset();
    }

    /** Waits until the recording has a line of this kind. */
    void waitForLine(const std::string& kind) const {
        while (read("events.jsonl").find("\"kind\":\"" + kind + "\"") == std::string::npos) {
            std::this_thread::yield();
        }
    }

    static std::string getEvents(const std::vector<Json>& lines) {
        std::string text;
        for (const Json& line : lines) {
            if (line["kind"] == "event" && line["event"] != "buffer" && line["event"] != "power") {
                text += line["event"].get<std::string>() + "@" +
                        std::to_string(line["t"].get<int64_t>() / 1000000) + " ";
            }
        }
        return text;
    }

    static std::vector<Json> select(const std::vector<Json>& lines, const std::string& kind) {
        std::vector<Json> selected;
        for (const Json& line : lines) {
            if (line["kind"] == kind) {
                selected.push_back(line);
            }
        }
        return selected;
    }
};

TEST_F(SessionRecordingTest, HoldsWhatHappenedInOrderAndInTime) {
    ASSERT_TRUE(record());
    runSession();
    SessionRecording::stop();
    const std::vector<Json> lines = readLines();
    EXPECT_EQ(getEvents(lines),
              "recordingBegin@300 speakingBegin@400 recordingDone@1100 "
              "results@1100 ");
    Texts kinds;
    for (const Json& line : lines) {
        const auto kind = line["kind"].get<std::string>();
        if (kinds.empty() || kinds.back() != kind) {
            kinds.push_back(kind);
        }
    }
    EXPECT_EQ(Texts(kinds.begin(), kinds.begin() + 9),
              (Texts{"call", "recorder", "started", "buffer", "noise", "buffer", "noise", "buffer",
                     "noise"}));
    EXPECT_EQ(kinds.back(), "end");
    EXPECT_EQ(select(lines, "call").size(), 1U);
    EXPECT_EQ(lines.back()["reason"], "over");
    EXPECT_EQ(lines.back()["sound"], 11 * BUFFER_BYTES);
    const std::vector<Json> buffers = select(lines, "buffer");
    ASSERT_EQ(buffers.size(), 11U);
    EXPECT_EQ(buffers[10], Json::parse(R"({"t":1100000000,"kind":"buffer","n":10,"offset":32000,
                                           "bytes":3200,"samples":1600})"));
    const std::vector<Json> verdicts = select(lines, "detector");
    ASSERT_EQ(verdicts.size(), 2U);
    EXPECT_EQ(verdicts[0]["speech"], true);
    EXPECT_EQ(verdicts[0]["t"], 400000000);
    EXPECT_EQ(verdicts[1]["speech"], false);
    EXPECT_EQ(verdicts[1]["t"], 1100000000);
    const Json results = select(lines, "event").back();
    EXPECT_EQ(results["outcome"], "accepted");
    EXPECT_EQ(results["requestId"], "request-1");
    EXPECT_EQ(results["hypotheses"][0]["text"], "go forward");
    EXPECT_EQ(results["hypotheses"].size(), 2U);
}

TEST_F(SessionRecordingTest, HoldsTheWayOfTheRequest) {
    ASSERT_TRUE(record());
    runSession();
    runSession();
    SessionRecording::stop();
    const std::vector<Json> lines = readLines();
    const Json attempt = select(lines, "attempt").at(0);
    EXPECT_EQ(attempt["attempt"], 1U);
    EXPECT_EQ(attempt["streamed"], false);
    const Json connection = select(lines, "connection").at(0);
    EXPECT_EQ(connection["new"], true);
    EXPECT_GT(connection["connected"], 0);
    EXPECT_FALSE(connection.contains("tls"));
    int64_t sent = 0;
    for (const Json& piece : select(lines, "sent")) {
        sent += piece["bytes"].get<int64_t>();
    }
    EXPECT_EQ(sent, attempt["bytes"]);
    EXPECT_EQ(select(lines, "head").at(0)["status"], 200);
    EXPECT_EQ(select(lines, "head").at(0)["headers"]["x-kvrequestid"], "request-1");
    EXPECT_EQ(select(lines, "attemptEnd").at(0)["code"], 200);
    EXPECT_EQ(select(lines, "finished").at(0)["code"], 200);
    // The second session finds the connection of the first.
    const Json kept = select(readLines(1), "connection").at(0);
    EXPECT_EQ(kept["new"], false);
    EXPECT_FALSE(kept.contains("connected"));
}

TEST_F(SessionRecordingTest, HoldsEverySample) {
    ASSERT_TRUE(record());
    runSession();
    SessionRecording::stop();
    std::string expected;
    for (int16_t played = 0; played < 1100; played = static_cast<int16_t>(played + 100)) {
        expected += getConstantBytes(played);
    }
    const std::string file = read("sound.wav");
    EXPECT_EQ(file.substr(WAV_HEAD_BYTES), expected);
    const std::string head = file.substr(0, WAV_HEAD_BYTES);
    EXPECT_EQ(head.substr(0, 4), "RIFF");
    EXPECT_EQ(head.substr(4, 4), std::string("\xA4\x89\x00\x00", 4));   // 35200 + 36 bytes
    EXPECT_EQ(head.substr(24, 4), std::string("\x80\x3E\x00\x00", 4));  // 16000 Hz
    EXPECT_EQ(head.substr(40, 4), std::string("\x80\x89\x00\x00", 4));
}

TEST_F(SessionRecordingTest, DescribesTheSession) {
    ASSERT_TRUE(record());
    runSession();
    SessionRecording::stop();
    const Json description = Json::parse(read("session.json"));
    EXPECT_EQ(description["format"], 1U);
    EXPECT_EQ(description["kit"], Talvox::Talvox::VERSION);
    EXPECT_EQ(description["source"], "a test");
    EXPECT_EQ(description["sampleRate"], 16000);
    EXPECT_EQ(description["hasSound"], true);
    EXPECT_EQ(description["reachability"], 1U);
    EXPECT_EQ(description["engine"]["vad"], SHORT_SPEECH);
    EXPECT_EQ(description["engine"]["url"], server.getUrl());
    EXPECT_EQ(description["recognizer"]["language"], "ru-RU");
    EXPECT_EQ(description["recognizer"]["myll"], Json::parse("[0,0]"));
}

TEST_F(SessionRecordingTest, HoldsNoUuid) {
    ASSERT_TRUE(record());
    runSession();
    SessionRecording::stop();
    for (const char* const file : {"session.json", "events.jsonl", "sound.wav"}) {
        const std::string bytes = read(file);
        EXPECT_FALSE(bytes.empty()) << file;
        EXPECT_EQ(bytes.find(CloudTest::UUID), std::string::npos) << file;
    }
    EXPECT_EQ(Json::parse(read("session.json"))["engine"]["uuid"], std::string(32, '0'));
}

TEST_F(SessionRecordingTest, LeavesTheSoundOut) {
    ASSERT_TRUE(record(1000000, false));
    runSession();
    SessionRecording::stop();
    EXPECT_FALSE(std::filesystem::exists(listRecordings().at(0) + "/sound.wav"));
    EXPECT_EQ(Json::parse(read("session.json"))["hasSound"], false);
    EXPECT_EQ(select(readLines(), "buffer").size(), 11U);
    EXPECT_EQ(readLines().back()["sound"], 0);
}

TEST_F(SessionRecordingTest, IsOffUnlessAskedFor) {
    runSession();
    EXPECT_FALSE(std::filesystem::exists(folder()));
    ASSERT_TRUE(record());
    SessionRecording::stop();
    runSession();
    EXPECT_TRUE(listRecordings().empty());
}

TEST_F(SessionRecordingTest, CanBeReadWhileTheSessionRuns) {
    ASSERT_TRUE(record());
    startSession(SHORT_SPEECH);
    play(200);
    waitForLine("buffer");
    const std::string head = read("sound.wav").substr(0, WAV_HEAD_BYTES);
    EXPECT_EQ(head.substr(4, 4), "\xFF\xFF\xFF\xFF");
    EXPECT_EQ(head.substr(40, 4), "\xFF\xFF\xFF\xFF");
    EXPECT_FALSE(Json::parse(read("session.json")).empty());
    EXPECT_EQ(readLines().at(0)["call"], "start");
    SessionRecording::stop();
    EXPECT_EQ(readLines().back()["reason"], "the recording was switched off");
    play(900);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts().back(), "results");
}

TEST_F(SessionRecordingTest, SaysFromInsideOfWhichEventACallCame) {
    ASSERT_TRUE(record());
    configureText(Talvox::Settings::SKS_VAD_SETTINGS, SHORT_SPEECH);
    makeSession();
    events->hook = [](const std::string& text, Talvox::Recognizer* recognizer) {
        if (text == "speakingBegin") {
            recognizer->cancel();
        }
    };
    session->start();
    play(1000);
    SessionRecording::stop();
    const std::vector<Json> lines = readLines();
    EXPECT_EQ(getEvents(lines), "recordingBegin@300 speakingBegin@400 error@400 ");
    const std::vector<Json> calls = select(lines, "call");
    ASSERT_EQ(calls.size(), 2U);
    EXPECT_FALSE(calls[0].contains("in"));
    EXPECT_EQ(calls[1]["call"], "cancel");
    EXPECT_EQ(calls[1]["in"], 3);
    EXPECT_EQ(select(lines, "event").at(3)["event"], "speakingBegin");
    EXPECT_EQ(select(lines, "event").back()["name"], "ErrorCanceled");
    EXPECT_EQ(select(lines, "event").back()["reason"], "the application cancelled");
}

TEST_F(SessionRecordingTest, HoldsRetries) {
    server.script({Answer::status(503)});
    ASSERT_TRUE(record());
    startSession(SHORT_SPEECH);
    play(1100);
    waitForLine("attemptEnd");
    while (!events->waitForEnds(1, std::chrono::milliseconds(1))) {
        advanceMs(100);
    }
    session.reset();
    SessionRecording::stop();
    const std::vector<Json> lines = readLines();
    EXPECT_EQ(select(lines, "attempt").size(), 2U);
    EXPECT_EQ(select(lines, "attemptEnd").at(0)["code"], 503);
    EXPECT_EQ(select(lines, "attemptEnd").at(1)["attempt"], 2);
    EXPECT_EQ(select(lines, "finished").at(0)["code"], 200);
}

TEST_F(SessionRecordingTest, MarksTheEndOfASessionThatIsReleased) {
    ASSERT_TRUE(record());
    startSession(SHORT_SPEECH);
    play(500);
    session.reset();
    SessionRecording::stop();
    EXPECT_EQ(select(readLines(), "call").back()["call"], "release");
    EXPECT_EQ(readLines().back()["reason"], "released");
}

TEST_F(SessionRecordingTest, HoldsWhenTheRecorderFailed) {
    ASSERT_TRUE(record());
    prepareRecorder = [](CloudTest::ScriptedRecorder& made) { made.failsWhenStopped = true; };
    startSession(SHORT_SPEECH);
    play(1100);
    SessionRecording::stop();
    EXPECT_EQ(select(readLines(), "recorderError").at(0)["in"], "stop");
    EXPECT_EQ(select(readLines(), "event").back()["name"], "ErrorAudio");
}

TEST_F(SessionRecordingTest, RemovesTheOldestBeyondTheBound) {
    ASSERT_TRUE(record());
    runSession();
    SessionRecording::stop();
    const std::string first = listRecordings().at(0);
    int64_t size = 0;
    for (const auto& entry : std::filesystem::directory_iterator(first)) {
        size += static_cast<int64_t>(entry.file_size());
    }
    scratch.write("recordings/other.txt", "not ours");
    std::filesystem::create_directory(folder() + "/20000101-000000-1-0001x");
    ASSERT_TRUE(record(2 * size + size / 2));
    runSession();
    runSession();
    SessionRecording::stop();
    EXPECT_FALSE(std::filesystem::exists(first));
    EXPECT_EQ(listRecordings().size(), 3U);  // two recordings and the folder of somebody else
    EXPECT_EQ(scratch.read(folder() + "/other.txt"), "not ours");
}

TEST_F(SessionRecordingTest, EndsAtTheBoundWhileTheSessionGoesOn) {
    const LogCapture log;
    ASSERT_TRUE(record(static_cast<int64_t>(5 * BUFFER_BYTES)));
    runSession();
    SessionRecording::stop();
    EXPECT_EQ(events->texts().back(), "results");
    EXPECT_EQ(readLines().back()["reason"], "the bound on the folder is reached");
    EXPECT_EQ(log.count("SessionRecording: a recording has reached the bound and ends"), 1U);
    EXPECT_EQ(read("sound.wav").size(), WAV_HEAD_BYTES + readLines().back()["sound"].get<size_t>());
}

/** Files cannot grow beyond this while it lives. */
class FileSizeLimit {
  public:
    explicit FileSizeLimit(rlim_t size) {
        signalHandler = std::signal(SIGXFSZ, SIG_IGN);
        getrlimit(RLIMIT_FSIZE, &before);
        const rlimit limit{size, before.rlim_max};
        setrlimit(RLIMIT_FSIZE, &limit);
    }
    ~FileSizeLimit() {
        setrlimit(RLIMIT_FSIZE, &before);
        std::signal(SIGXFSZ, signalHandler);
    }
    FileSizeLimit(const FileSizeLimit&) = delete;
    FileSizeLimit& operator=(const FileSizeLimit&) = delete;

  private:
    void (*signalHandler)(int) = nullptr;
    rlimit before{};
};

TEST_F(SessionRecordingTest, EndsWithAMarkWhenTheDiskTakesNoMore) {
    const LogCapture log;
    ASSERT_TRUE(record());
    {
        const FileSizeLimit limit(6 * BUFFER_BYTES);
        runSession();
        SessionRecording::stop();
    }
    EXPECT_EQ(events->texts().back(), "results");
    const std::vector<Json> lines = readLines();
    EXPECT_EQ(lines.back()["kind"], "end");
    EXPECT_EQ(lines.back()["reason"], "disk: File too large");
    EXPECT_EQ(log.count("SessionRecording: sound could not be written, the recording ends: "
                        "File too large"),
              1U);
    const std::string sound = read("sound.wav");
    EXPECT_EQ(sound.size(), WAV_HEAD_BYTES + lines.back()["sound"].get<std::size_t>());
    EXPECT_GT(sound.size(), WAV_HEAD_BYTES);
}

TEST_F(SessionRecordingTest, RefusesAFolderThatCannotBeUsed) {
    const LogCapture log;
    scratch.write("recordings", "a file");
    EXPECT_FALSE(record());
    EXPECT_EQ(log.count("SessionRecording: " + folder() + " cannot be used: Not a directory"), 1U);
    Talvox::SessionRecordingOptions options;
    EXPECT_FALSE(SessionRecording::start(options));
    options.folder = scratch.path("there/is/none");
    EXPECT_FALSE(SessionRecording::start(options));
    runSession();
    EXPECT_EQ(events->texts().back(), "results");
}

TEST_F(SessionRecordingTest, EndsWhenTheDiskIsTooSlow) {
    const LogCapture log;
    std::filesystem::create_directory(folder());
    Talvox::RecordingWriter writer(folder(), int64_t{100} * 1024 * 1024);
    const auto files = boost::make_shared<Talvox::RecordingFiles>(16000);
    const std::vector<unsigned char> sound(Talvox::RecordingWriter::MOST_QUEUED_BYTES / 4);
    // A thread that has not started yet is as slow as can be.
    writer.open(files, 0, "{}\n");
    for (int i = 0; i < 3; ++i) {
        writer.writeSound(files, sound.data(), sound.size());
        EXPECT_FALSE(files->isBroken());
    }
    writer.writeSound(files, sound.data(), sound.size());
    EXPECT_TRUE(files->isBroken());
    ASSERT_TRUE(writer.start());
    writer.stop();
    EXPECT_EQ(log.count("SessionRecording: the disk is too slow, the recording ends"), 1U);
    EXPECT_EQ(readLines().back()["reason"], "the disk is too slow");
    EXPECT_EQ(readLines().back()["sound"], 3 * sound.size());
}

TEST(JsonObjectTest, EscapesWhatJsonCannotHold) {
    Talvox::JsonObject object;
    object.addText("a\"", std::string("\\ \n \x01 \xC3\xA9 \xFF \xED\xA0\x80 \xF0\x9F\x98\x80"));
    object.addNumber("x", 0.1F).addNumber("none", NAN).addBoolean("yes", true).add("n", -5);
    const Json json = Json::parse(object.getText());
    const std::string bad = "\xEF\xBF\xBD";
    EXPECT_EQ(json["a\""],
              "\\ \n \x01 \xC3\xA9 " + bad + " " + bad + bad + bad + " \xF0\x9F\x98\x80");
    EXPECT_EQ(json["x"].get<float>(), 0.1F);
    EXPECT_TRUE(json["none"].is_null());
    EXPECT_EQ(json["yes"], true);
    EXPECT_EQ(json["n"], -5);
    EXPECT_EQ(Talvox::JsonObject().getText(), "{}");
}

}  // namespace
