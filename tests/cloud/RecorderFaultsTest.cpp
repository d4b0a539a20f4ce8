#include <gtest/gtest.h>

#include <boost/make_shared.hpp>

#include "SessionTest.h"
#include "pal/kd.h"
#include "support/LogCapture.h"

namespace {

using CloudTest::ENDLESS_SPEECH;
using CloudTest::makeConstantBuffer;
using CloudTest::ScriptedRecorder;
using CloudTest::SHORT_SPEECH;
using CloudTest::Texts;
using Talvox::Settings;
using TestSupport::Answer;

/** Recorders that do what they should not. */
class RecorderFaultsTest : public CloudTest::SessionTest {
  protected:
    RecorderFaultsTest() { server.setDefaultAnswer(Answer::never()); }

    void expectOneEnd(const std::string& end) {
        EXPECT_EQ(events->texts().back(), end);
        EXPECT_TRUE(isEngineFree());
        advanceMs(40000);
        kdDrainEventsKOR();
        EXPECT_EQ(events->countEnds(), 1U);
    }
};

TEST_F(RecorderFaultsTest, FailureInsideStop) {
    prepareRecorder = [](ScriptedRecorder& made) { made.failsWhenStopped = true; };
    startSession(ENDLESS_SPEECH);
    play(500);
    session->stop();
    EXPECT_EQ(recorder->stops, 1);
    EXPECT_EQ(events->texts(), (Texts{"recordingBegin", "speakingBegin", "error ErrorAudio"}));
    expectOneEnd("error ErrorAudio");
}

TEST_F(RecorderFaultsTest, FailureInsideCancel) {
    prepareRecorder = [](ScriptedRecorder& made) { made.failsWhenStopped = true; };
    startSession(ENDLESS_SPEECH);
    play(500);
    session->cancel();
    EXPECT_EQ(recorder->stops, 1);
    expectOneEnd("error ErrorAudio");
}

TEST_F(RecorderFaultsTest, FailureWhenAnEarlyAnswerStopsTheRecording) {
    configure([](Settings& settings) { settings.putBoolean(Settings::SKS_STREAMING, true); });
    server.setDefaultAnswer(CloudTest::answerGoForward().onHead().held());
    prepareRecorder = [](ScriptedRecorder& made) { made.failsWhenStopped = true; };
    startSession(ENDLESS_SPEECH);
    play(500);
    server.release();
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_FALSE(recorder->isRecording());
    expectOneEnd("results");
}

TEST_F(RecorderFaultsTest, BufferFromInsideStop) {
    prepareRecorder = [](ScriptedRecorder& made) { made.flushes = makeConstantBuffer(7); };
    startSession(SHORT_SPEECH);
    play(1100);
    EXPECT_EQ(recorder->stops, 1);
    EXPECT_EQ(events->texts(), (Texts{"recordingBegin", "speakingBegin", "recordingDone"}));
    ASSERT_TRUE(server.waitForRequest(1));
    EXPECT_EQ(server.getRequest(0).body.find(CloudTest::getConstantBytes(7)), std::string::npos);
}

TEST_F(RecorderFaultsTest, BufferFromInsideTheEnd) {
    prepareRecorder = [](ScriptedRecorder& made) { made.flushes = makeConstantBuffer(7); };
    startSession(ENDLESS_SPEECH);
    play(500);
    const std::size_t heard = events->countBuffers();
    session->cancel();
    EXPECT_EQ(events->countBuffers(), heard);
    expectOneEnd("error ErrorCanceled");
}

TEST_F(RecorderFaultsTest, FailureAtStartEndsTheRecording) {
    prepareRecorder = [](ScriptedRecorder& made) { made.failsAtStart = true; };
    startSession(ENDLESS_SPEECH);
    EXPECT_FALSE(recorder->isRecording());
    expectOneEnd("error ErrorAudio");
}

TEST_F(RecorderFaultsTest, FailureInsideAnInitThatFails) {
    prepareRecorder = [](ScriptedRecorder& made) {
        made.works = false;
        made.insideInit = [&made] { made.fail(); };
    };
    startSession(ENDLESS_SPEECH);
    EXPECT_EQ(events->texts(), Texts{"error ErrorAudio"});
    expectOneEnd("error ErrorAudio");
}

TEST_F(RecorderFaultsTest, CancelInsideInit) {
    prepareRecorder = [this](ScriptedRecorder& made) {
        made.insideInit = [this] { session->cancel(); };
    };
    startSession(ENDLESS_SPEECH);
    EXPECT_FALSE(recorder->isRecording());
    EXPECT_EQ(events->texts(), Texts{"error ErrorCanceled"});
    expectOneEnd("error ErrorCanceled");
}

TEST_F(RecorderFaultsTest, StopInsideTheStartOfTheRecorder) {
    prepareRecorder = [this](ScriptedRecorder& made) {
        made.insideStart = [this] { session->stop(); };
    };
    startSession(ENDLESS_SPEECH);
    EXPECT_FALSE(recorder->isRecording());
    EXPECT_EQ(events->texts(), Texts{"error ErrorAudio"});
    expectOneEnd("error ErrorAudio");
}

TEST_F(RecorderFaultsTest, EmptyBuffersAreNoSound) {
    startSession(ENDLESS_SPEECH);
    play(500);
    for (int i = 0; i < 20; ++i) {
        advanceMs(1000);
        recorder->deliver(CloudTest::makeBuffer({}));
    }
    EXPECT_EQ(events->countEnds(), 1U);
    expectOneEnd("error ErrorAudio");
}

TEST_F(RecorderFaultsTest, SoundThatComesTooSlowly) {
    const TestSupport::LogCapture log;
    startSession(ENDLESS_SPEECH);
    play(500);
    for (int i = 0; i < 59; ++i) {
        advanceMs(1000);
        recorder->deliver(makeConstantBuffer(1));
    }
    EXPECT_EQ(events->countEnds(), 0U);
    advanceMs(1000);
    EXPECT_TRUE(log.contains("KorvelRecognizer: the recorder delivers too little"));
    expectOneEnd("error ErrorAudio");
}

}  // namespace
