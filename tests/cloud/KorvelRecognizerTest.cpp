#include "talvox/impl/KorvelRecognizer.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <fstream>
#include <iterator>

#include "DetectorCalls.h"
#include "SessionTest.h"
#include "core/network/NetworkManager.h"
#include "core/sound/FileRecorder.h"
#include "pal/kd.h"
#include "support/LogCapture.h"
#include "support/ScratchDirectory.h"
#include "talvox/impl/VoicePowerEstimator.h"

namespace {

using CloudTest::ENDLESS_SPEECH;
using CloudTest::makeConstantBuffer;
using CloudTest::NEVER_SPEECH;
using CloudTest::SHORT_SPEECH;
using CloudTest::Texts;
using CloudTest::UUID;
using Talvox::KorvelRecognizer;
using Talvox::Settings;
using TestSupport::Answer;
using TestSupport::LogCapture;

const int64_t NS_PER_MS = 1000000;

class KorvelRecognizerTest : public CloudTest::SessionTest {};

TEST_F(KorvelRecognizerTest, KnowsItsLanguages) {
    const std::vector<std::string>& languages = KorvelRecognizer::getAvailableLanguages();
    EXPECT_EQ(languages, (Texts{"ru-RU", "tr-TR", "uk-UA"}));
    EXPECT_EQ(&languages, &KorvelRecognizer::getAvailableLanguages());
}

// --- A session from its beginning to its end ---

TEST_F(KorvelRecognizerTest, ReportsASessionInOrderAndInTime) {
    startSession(SHORT_SPEECH);
    play(3000);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts(),
              (Texts{"recordingBegin", "speakingBegin", "recordingDone", "results"}));
    EXPECT_EQ(events->timeOf("recordingBegin"), 300);
    EXPECT_EQ(events->timeOf("speakingBegin"), 400);
    EXPECT_EQ(events->timeOf("recordingDone"), 1100);
    EXPECT_EQ(events->countBuffers(), 8U);
    EXPECT_EQ(events->powers().size(), 8U);
    const boost::shared_ptr<Talvox::Recognition> recognition = events->recognition();
    EXPECT_EQ(recognition->getOutcome(), Talvox::Recognition::OutcomeAccepted);
    EXPECT_EQ(recognition->getRequestId(), "request-1");
    ASSERT_EQ(recognition->getResults()->size(), 2U);
    EXPECT_EQ(recognition->getResults()->front().getText(), "go forward");
    EXPECT_TRUE(isEngineFree());
}

TEST_F(KorvelRecognizerTest, SendsEveryBufferFromTheFirst) {
    for (const bool streaming : {false, true}) {
        configure([streaming](Settings& settings) {
            settings.putBoolean(Settings::SKS_STREAMING, streaming);
        });
        startSession(SHORT_SPEECH);
        play(1100);
        ASSERT_TRUE(events->waitForEnds());
        std::string sound;
        for (int16_t played = 0; played < 1100; played = static_cast<int16_t>(played + 100)) {
            sound += CloudTest::getConstantBytes(played);
        }
        const auto request = server.getRequest(streaming ? 1 : 0);
        EXPECT_EQ(request.line().find("POST /asrgw_chunked?") == 0, streaming);
        EXPECT_NE(request.body.find("\r\n\r\n" + sound + "\r\n--"), std::string::npos);
    }
}

TEST_F(KorvelRecognizerTest, HearsRealSoundWithTheDefaultDetector) {
    const TestSupport::Samples voice = TestSupport::makeSpeechLike(CloudTest::SAMPLE_RATE, 1400);
    TestSupport::Samples sound(8000);
    sound.insert(sound.end(), voice.begin(), voice.end());
    Sound::Recorder::setFactory(
        [&sound] { return boost::make_shared<Sound::FileRecorder>(sound); });
    startSession("");
    advanceMs(5000);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts(),
              (Texts{"recordingBegin", "speakingBegin", "recordingDone", "results"}));
    EXPECT_EQ(events->timeOf("recordingBegin"), 220);
    EXPECT_GE(events->timeOf("speakingBegin"), 600);
    EXPECT_LE(events->timeOf("speakingBegin"), 1500);
    EXPECT_GE(events->timeOf("recordingDone"), 1900);
    EXPECT_LE(events->timeOf("recordingDone"), 3500);
}

TEST_F(KorvelRecognizerTest, LearnsNoiseForMoreThanTheDetectorsTime) {
    startSession(NEVER_SPEECH);
    const auto buffer = makeConstantBuffer(1);
    advanceMs(200);
    recorder->deliver(buffer);
    kdAdvanceClockKOR(NS_PER_MS - 1);
    recorder->deliver(buffer);
    EXPECT_EQ(events->texts(), Texts{});
    kdAdvanceClockKOR(1);
    recorder->deliver(buffer);
    EXPECT_EQ(events->texts(), Texts{"recordingBegin"});
    EXPECT_EQ(events->timeOf("recordingBegin"), 201);
    EXPECT_EQ(events->countBuffers(), 0U);
    recorder->deliver(buffer);
    EXPECT_EQ(events->countBuffers(), 1U);
    EXPECT_EQ(events->powers().size(), 1U);
}

TEST_F(KorvelRecognizerTest, ReportsTheLevelOfTheSound) {
    for (const std::string& mode :
         {Settings::SESSION_MODE_GENERAL, Settings::SESSION_MODE_VOICE_RECOGNITION}) {
        configureText(Settings::SKS_SESSION_MODE, mode);
        startSession(NEVER_SPEECH);
        play(1000);
        Talvox::VoicePowerEstimator estimator;
        estimator.setMode(mode == Settings::SESSION_MODE_GENERAL ? 0 : 1);
        std::vector<float> levels;
        for (int16_t played = 0; played < 1000; played = static_cast<int16_t>(played + 100)) {
            if (played < 300) {
                estimator.learnNoise(*makeConstantBuffer(played));
            } else {
                estimator.updatePower(*makeConstantBuffer(played));
                levels.push_back(estimator.getLevel());
            }
        }
        EXPECT_EQ(events->powers(), levels) << mode;
    }
}

TEST_F(KorvelRecognizerTest, SetsUpTheRecorder) {
    configure([](Settings& settings) { settings.putInt(Settings::SKS_SAMPLE_RATE, 8000); });
    configureText(Settings::SKS_SESSION_MODE, Settings::SESSION_MODE_GENERAL);
    startSession(NEVER_SPEECH);
    EXPECT_TRUE(recorder->initialised);
    EXPECT_TRUE(recorder->isRecording());
    EXPECT_EQ(recorder->getSampleRate(), 8000);
    EXPECT_EQ(recorder->getBufferLength(), 100);
    EXPECT_EQ(recorder->getMode(), Sound::Recorder::MODE_GENERAL);
}

TEST_F(KorvelRecognizerTest, UnknownSessionModeIsLoggedAndKeepsVoiceRecognition) {
    configureText(Settings::SKS_SESSION_MODE, "General");
    const LogCapture log;
    startSession(NEVER_SPEECH);
    EXPECT_EQ(recorder->getMode(), Sound::Recorder::MODE_VOICE_RECOGNITION);
    EXPECT_TRUE(log.contains("KorvelRecognizer: unknown session mode General"));
}

TEST_F(KorvelRecognizerTest, GivesTheSessionModeToTheDetector) {
    for (const std::string& mode :
         {Settings::SESSION_MODE_GENERAL, Settings::SESSION_MODE_VOICE_RECOGNITION}) {
        configureText(Settings::SKS_SESSION_MODE, mode);
        CloudTest::takeDetectorCalls();
        startSession(NEVER_SPEECH);
        const bool isGeneral = mode == Settings::SESSION_MODE_GENERAL;
        EXPECT_EQ(CloudTest::takeDetectorCalls(), isGeneral ? Texts{"force noise"} : Texts{})
            << mode;
    }
}

TEST_F(KorvelRecognizerTest, GivesTheDetectorTheLeadingNoiseToLearn) {
    startSession(NEVER_SPEECH);
    CloudTest::takeDetectorCalls();
    for (int i = 0; i < 4; ++i) {
        advanceMs(100);
        recorder->deliver(makeConstantBuffer(20000));
    }
    // Three buffers of the leading noise, loud enough for the strictest thresholds.
    EXPECT_EQ(CloudTest::takeDetectorCalls(),
              (Texts{"individual 98", "individual 98", "individual 98"}));
}

// --- Limits ---

TEST_F(KorvelRecognizerTest, NobodySpeaking) {
    startSession(NEVER_SPEECH);
    play(4900);
    kdAdvanceClockKOR(100 * NS_PER_MS - 1);
    recorder->deliver(makeConstantBuffer(0));
    EXPECT_EQ(events->countEnds(), 0U);
    kdAdvanceClockKOR(1);
    recorder->deliver(makeConstantBuffer(0));
    EXPECT_EQ(events->texts(), (Texts{"recordingBegin", "error ErrorNoVoice"}));
    EXPECT_EQ(events->timeOf("error ErrorNoVoice"), 5000);
    EXPECT_FALSE(recorder->isRecording());
    EXPECT_TRUE(isEngineFree());
    play(10000);
    EXPECT_EQ(events->countEnds(), 1U);
    EXPECT_EQ(server.getRequestCount(), 0U);
}

TEST_F(KorvelRecognizerTest, SpeechThatNeverEnds) {
    startSession(ENDLESS_SPEECH);
    play(20000);
    EXPECT_EQ(events->texts(), (Texts{"recordingBegin", "speakingBegin"}));
    EXPECT_TRUE(recorder->isRecording());
    play(100);
    EXPECT_EQ(events->texts(), (Texts{"recordingBegin", "speakingBegin", "recordingDone"}));
    EXPECT_EQ(events->timeOf("recordingDone"), 20100);
    EXPECT_FALSE(recorder->isRecording());
    EXPECT_TRUE(events->waitForEnds());
}

TEST_F(KorvelRecognizerTest, LimitCountsSoundNotTime) {
    startSession(ENDLESS_SPEECH);
    advanceMs(201);
    for (int i = 0; i < 200; ++i) {
        recorder->deliver(makeConstantBuffer(0));
    }
    EXPECT_TRUE(recorder->isRecording());
    recorder->deliver(makeConstantBuffer(0));
    EXPECT_FALSE(recorder->isRecording());
    EXPECT_TRUE(events->waitForEnds());
}

TEST_F(KorvelRecognizerTest, RecorderThatDeliversNothing) {
    const LogCapture log;
    startSession(NEVER_SPEECH);
    play(300);
    advanceMs(9000);
    EXPECT_EQ(events->countEnds(), 0U);
    advanceMs(11000);
    EXPECT_EQ(events->texts(), (Texts{"recordingBegin", "error ErrorAudio"}));
    EXPECT_TRUE(log.contains("KorvelRecognizer: the recorder delivers nothing"));
    EXPECT_TRUE(isEngineFree());
}

TEST_F(KorvelRecognizerTest, BuffersWithoutARateHaveNoLength) {
    startSession(ENDLESS_SPEECH);
    play(400);
    const Sound::SoundDataInfo info(Sound::SoundDataInfo::NONE, 1, 0, 2, 1600);
    for (int i = 0; i < 300; ++i) {
        recorder->deliver(boost::make_shared<Sound::SoundDataBuffer>(info, CloudTest::Bytes(3200)));
    }
    EXPECT_TRUE(recorder->isRecording());
}

// --- Refusals at the start ---

TEST_F(KorvelRecognizerTest, SecondSessionIsRefused) {
    startSession(SHORT_SPEECH);
    const auto firstRecorder = recorder;
    const auto others = boost::make_shared<CloudTest::EventRecorder>();
    const auto second = engine().createRecognizer(others, boost::make_shared<Settings>());
    second->start();
    EXPECT_EQ(others->texts(), Texts{"error ErrorBusy"});
    EXPECT_EQ(recorder, firstRecorder);
    EXPECT_FALSE(isEngineFree());
    play(1100);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts().back(), "results");
    second->cancel();
    second->stop();
    EXPECT_EQ(others->texts(), Texts{"error ErrorBusy"});
}

TEST_F(KorvelRecognizerTest, StartedTwiceEndsBusy) {
    startSession(SHORT_SPEECH);
    play(500);
    session->start();
    EXPECT_EQ(events->texts(), (Texts{"recordingBegin", "speakingBegin", "error ErrorBusy"}));
    EXPECT_FALSE(recorder->isRecording());
    EXPECT_TRUE(isEngineFree());
}

TEST_F(KorvelRecognizerTest, StartAfterTheEndIsOnlyLogged) {
    startSession(SHORT_SPEECH);
    session->cancel();
    const LogCapture log;
    session->start();
    EXPECT_TRUE(log.contains("KorvelRecognizer: the session is over, start is ignored"));
    EXPECT_EQ(events->texts(), Texts{"error ErrorCanceled"});
    EXPECT_TRUE(isEngineFree());
}

TEST_F(KorvelRecognizerTest, WithoutNetwork) {
    Network::NetworkManager::getInstance().overrideReachability(
        Network::NetworkManager::UNREACHABLE);
    const LogCapture log;
    startSession(SHORT_SPEECH);
    EXPECT_EQ(events->texts(), Texts{"error ErrorNetwork"});
    EXPECT_TRUE(log.contains(std::string("KorvelRecognizer: uuid ") + UUID + ", url " +
                             server.getUrl() + ", reachability 0; failing"));
    EXPECT_FALSE(recorder);
    EXPECT_TRUE(isEngineFree());
}

TEST_F(KorvelRecognizerTest, WithoutIdentifierOrAddress) {
    for (const std::string& key : {Settings::SKS_UUID, Settings::SKS_URL}) {
        const std::string before = engine().getTalvoxSettings()->getString(key);
        configureText(key, "");
        const LogCapture log;
        startSession(SHORT_SPEECH);
        EXPECT_EQ(events->texts(), Texts{"error ErrorNetwork"}) << key;
        EXPECT_TRUE(log.containsPart(key + " , ")) << key;
        EXPECT_TRUE(log.containsPart("reachability 1; failing")) << key;
        configureText(key, before);
    }
}

TEST_F(KorvelRecognizerTest, WithoutMicrophone) {
    prepareRecorder = [](CloudTest::ScriptedRecorder& made) { made.works = false; };
    startSession(SHORT_SPEECH);
    EXPECT_EQ(events->texts(), Texts{"error ErrorAudio"});
    EXPECT_TRUE(isEngineFree());
    session->cancel();
    session->stop();
    session->start();
    EXPECT_EQ(events->texts(), Texts{"error ErrorAudio"});
}

TEST_F(KorvelRecognizerTest, MicrophoneThatFailsToStart) {
    prepareRecorder = [](CloudTest::ScriptedRecorder& made) { made.failsAtStart = true; };
    startSession(SHORT_SPEECH);
    EXPECT_EQ(events->texts(), Texts{"error ErrorAudio"});
    EXPECT_FALSE(recorder->isRecording());
    EXPECT_TRUE(isEngineFree());
    play(1000);
    advanceMs(30000);
    EXPECT_EQ(events->texts(), Texts{"error ErrorAudio"});
}

TEST_F(KorvelRecognizerTest, MicrophoneThatFailsLater) {
    startSession(SHORT_SPEECH);
    play(600);
    recorder->fail();
    EXPECT_EQ(events->texts(), (Texts{"recordingBegin", "speakingBegin", "error ErrorAudio"}));
    EXPECT_TRUE(isEngineFree());
    play(1000);
    EXPECT_EQ(events->countEnds(), 1U);
}

// --- Stop and cancel ---

TEST_F(KorvelRecognizerTest, StoppedBeforeAnySound) {
    startSession(SHORT_SPEECH);
    session->stop();
    EXPECT_EQ(events->texts(), (Texts{"recordingDone", "error ErrorAudio"}));
    EXPECT_TRUE(isEngineFree());
    session->stop();
    EXPECT_EQ(events->countEnds(), 1U);
}

TEST_F(KorvelRecognizerTest, StoppedWhileLearningNoise) {
    startSession(SHORT_SPEECH);
    play(200);
    session->stop();
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts(), (Texts{"recordingDone", "results"}));
    EXPECT_EQ(events->countBuffers(), 0U);
}

TEST_F(KorvelRecognizerTest, StoppedWhileWaitingForSpeech) {
    startSession(NEVER_SPEECH);
    play(1000);
    session->stop();
    session->stop();
    EXPECT_FALSE(recorder->isRecording());
    const std::size_t heard = events->countBuffers();
    play(500);
    EXPECT_EQ(events->countBuffers(), heard);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts(), (Texts{"recordingBegin", "recordingDone", "results"}));
    EXPECT_EQ(server.getRequestCount(), 1U);
}

TEST_F(KorvelRecognizerTest, StoppedBeforeTheStartDoesNothing) {
    makeSession();
    session->stop();
    EXPECT_EQ(events->texts(), Texts{});
    session->start();
    EXPECT_TRUE(recorder->isRecording());
}

TEST_F(KorvelRecognizerTest, CancelledInEveryState) {
    server.setDefaultAnswer(Answer::never());
    for (const int played : {0, 200, 300, 500, 1100}) {
        startSession(SHORT_SPEECH);
        play(played);
        session->cancel();
        session->cancel();
        EXPECT_EQ(events->countEnds(), 1U) << played;
        EXPECT_EQ(events->texts().back(), "error ErrorCanceled") << played;
        EXPECT_FALSE(recorder->isRecording()) << played;
        EXPECT_TRUE(isEngineFree()) << played;
        play(2000);
        advanceMs(30000);
        EXPECT_EQ(events->countEnds(), 1U) << played;
    }
}

TEST_F(KorvelRecognizerTest, CancelledBeforeTheStart) {
    makeSession();
    session->cancel();
    EXPECT_EQ(events->texts(), Texts{"error ErrorCanceled"});
    session->start();
    EXPECT_FALSE(recorder);
    EXPECT_EQ(events->countEnds(), 1U);
}

TEST_F(KorvelRecognizerTest, CancelledAfterResultsReportsNothing) {
    startSession(SHORT_SPEECH);
    play(1100);
    ASSERT_TRUE(events->waitForEnds());
    session->cancel();
    EXPECT_EQ(events->countEnds(), 1U);
}

// --- What the protocol says ---

TEST_F(KorvelRecognizerTest, LateProtocolEventsAreNotReported) {
    startSession(SHORT_SPEECH);
    play(1100);
    ASSERT_TRUE(events->waitForEnds());
    const Texts before = events->texts();
    const auto recognizer = boost::dynamic_pointer_cast<KorvelRecognizer>(session);
    recognizer->onProtocolError(Talvox::SpeechError(Talvox::SpeechError::ErrorNetwork));
    recognizer->onProtocolVoiceBegin();
    recognizer->onProtocolVoiceCaptured();
    recognizer->onProtocolResults(boost::make_shared<Talvox::RecognitionResults>(), "late");
    recognizer->onRecorderError(nullptr);
    recognizer->onRecorderDataReceived(nullptr, makeConstantBuffer(1));
    EXPECT_EQ(events->texts(), before);
}

TEST_F(KorvelRecognizerTest, LogsHowLongTheRequestTook) {
    configure([](Settings& settings) { settings.putInt(Settings::SKS_VERBOSE_LEVEL, 2); });
    server.script({CloudTest::answerGoForward().held(), Answer::never()});
    const LogCapture log;
    startSession(SHORT_SPEECH);
    play(1100);
    ASSERT_TRUE(server.waitForRequest(1));
    advanceMs(1234);
    server.release();
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_TRUE(log.contains("Request request-1 finished in 1234 msec"));

    startSession(SHORT_SPEECH);
    play(1100);
    ASSERT_TRUE(server.waitForRequest(2));
    advanceMs(20000);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_TRUE(log.contains("Request failed in 20000 msec"));
}

TEST_F(KorvelRecognizerTest, LogsNoRequestThatFailedBeforeListeningHasStopped) {
    configure([](Settings& settings) { settings.putInt(Settings::SKS_VERBOSE_LEVEL, 2); });
    const LogCapture log;
    startSession(NEVER_SPEECH);
    play(5000);
    EXPECT_EQ(events->texts().back(), "error ErrorNoVoice");
    EXPECT_FALSE(log.containsPart("Request failed in"));
}

TEST_F(KorvelRecognizerTest, TheRequestBeginsWhenTheRecorderHasStopped) {
    configure([](Settings& settings) { settings.putInt(Settings::SKS_VERBOSE_LEVEL, 2); });
    prepareRecorder = [](CloudTest::ScriptedRecorder& made) {
        made.insideStop = [] { advanceMs(50); };
    };
    server.script({CloudTest::answerGoForward().held()});
    const LogCapture log;
    startSession(ENDLESS_SPEECH);
    play(500);
    session->stop();
    ASSERT_TRUE(server.waitForRequest(1));
    advanceMs(1000);
    server.release();
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_TRUE(log.contains("Request request-1 finished in 1000 msec"));
}

TEST_F(KorvelRecognizerTest, AnswerBeforeTheEndOfSpeechEndsTheSession) {
    configure([](Settings& settings) { settings.putBoolean(Settings::SKS_STREAMING, true); });
    server.script({CloudTest::answerGoForward().onHead().held()});
    startSession(ENDLESS_SPEECH);
    play(500);
    server.release();
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts(), (Texts{"recordingBegin", "speakingBegin", "results"}));
    EXPECT_FALSE(recorder->isRecording());
    EXPECT_TRUE(isEngineFree());
    play(1000);
    advanceMs(30000);
    EXPECT_EQ(events->countEnds(), 1U);
}

// --- The dump ---

TEST_F(KorvelRecognizerTest, DumpsItsSoundWhereARootIsMounted) {
    const TestSupport::ScratchDirectory directory;
    ASSERT_EQ(kdMountKOR("/removable", directory.path("").c_str()), 0);
    startSession(SHORT_SPEECH);
    play(1100);
    kdMountKOR("/removable", nullptr);
    std::ifstream file(directory.path("in.wav"), std::ios::binary);
    const std::string dump{std::istreambuf_iterator<char>(file), {}};
    ASSERT_EQ(dump.size(), 44U + 11U * 3200U);
    EXPECT_EQ(dump.substr(0, 4), "RIFF");
    for (std::size_t i = 0; i < 11; ++i) {
        EXPECT_EQ(dump.substr(44 + 3200 * i, 3200),
                  CloudTest::getConstantBytes(static_cast<int16_t>(100 * i)))
            << i;
    }
    EXPECT_TRUE(events->waitForEnds());
}

TEST_F(KorvelRecognizerTest, ListeningHasStoppedWhenRecordingIsDone) {
    const TestSupport::ScratchDirectory directory;
    ASSERT_EQ(kdMountKOR("/removable", directory.path("").c_str()), 0);
    configureText(Settings::SKS_VAD_SETTINGS, SHORT_SPEECH);
    makeSession();
    std::string dump;
    bool wasRecording = true;
    events->hook = [&](const std::string& event, Talvox::Recognizer*) {
        if (event == "recordingDone") {
            dump = TestSupport::ScratchDirectory::read(directory.path("in.wav"));
            wasRecording = recorder->isRecording();
        }
    };
    session->start();
    play(1100);
    kdMountKOR("/removable", nullptr);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_FALSE(wasRecording);
    // The header holds the length of the data once the file is closed.
    ASSERT_EQ(dump.size(), 44U + 35200U);
    EXPECT_EQ(dump.substr(40, 4), std::string("\x80\x89\0\0", 4));
}

TEST_F(KorvelRecognizerTest, MissingDumpIsLoggedOnce) {
    const LogCapture log;
    startSession(SHORT_SPEECH);
    play(1100);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts().back(), "results");
    EXPECT_EQ(log.count("init: could not open file /removable/in.wav"), 1U);
    EXPECT_FALSE(log.contains("write: file not opened"));
}

// --- Settings ---

TEST_F(KorvelRecognizerTest, SettingsChangedInMidSessionConcernTheNextOne) {
    for (const bool streaming : {false, true}) {
        configure([&](Settings& settings) {
            settings.putBoolean(Settings::SKS_STREAMING, streaming);
            settings.putString(Settings::SKS_URL, server.getUrl());
            settings.putString(Settings::SKS_UUID, UUID);
        });
        startSession(SHORT_SPEECH);
        play(500);
        configure([](Settings& settings) {
            settings.putString(Settings::SKS_URL, "");
            settings.putString(Settings::SKS_UUID, "");
            settings.putString(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
            settings.putInt(Settings::SKS_SAMPLE_RATE, 0);
        });
        play(600);
        ASSERT_TRUE(events->waitForEnds());
        EXPECT_EQ(events->texts().back(), "results") << streaming;
        startSession();
        EXPECT_EQ(events->texts(), Texts{"error ErrorNetwork"}) << streaming;
        configureText(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_PCM);
        configure([](Settings& settings) { settings.putInt(Settings::SKS_SAMPLE_RATE, 16000); });
    }
}

TEST_F(KorvelRecognizerTest, SurvivesAbsurdSettings) {
    for (const int rate : {0, -1, 1, 7, 44100, 2147483647}) {
        for (const std::string& vad : {std::string(), std::string("engine=wrtc;framems=-5"),
                                       std::string("framems=0"), std::string("=;==;framems=abc")}) {
            configure([rate](Settings& settings) {
                settings.putInt(Settings::SKS_SAMPLE_RATE, rate);
                settings.putInt(Settings::SKS_SPEEX_QUALITY, -100);
                settings.putString(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
            });
            startSession(vad);
            play(400);
            session->cancel();
            EXPECT_EQ(events->countEnds(), 1U) << rate << " " << vad;
        }
    }
}

}  // namespace
