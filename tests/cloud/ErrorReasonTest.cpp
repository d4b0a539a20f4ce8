#include <gtest/gtest.h>

#include <boost/make_shared.hpp>

#include "SessionTest.h"
#include "core/network/NetworkManager.h"
#include "pal/kd.h"
#include "support/LogCapture.h"
#include "talvox/DummyRecognizer.h"

namespace {

using CloudTest::ENDLESS_SPEECH;
using CloudTest::NEVER_SPEECH;
using CloudTest::ScriptedRecorder;
using CloudTest::SHORT_SPEECH;
using Talvox::Settings;
using TestSupport::Answer;

const TestSupport::Headers RETRY_AFTER = {{"Retry-After", "2"}};

/** What a session says about its error. */
class ErrorReasonTest : public CloudTest::SessionTest {
  protected:
    void expectEnd(const std::string& error, const std::string& reason) {
        ASSERT_TRUE(events->waitForEnds());
        EXPECT_EQ(events->texts().back(), "error " + error);
        EXPECT_EQ(events->errorReason(), reason);
        EXPECT_EQ(session->getErrorReason(), reason);
    }
};

/** The same for both kinds of requests. */
class RequestReasonTest : public ErrorReasonTest, public ::testing::WithParamInterface<bool> {
  protected:
    RequestReasonTest() {
        configure(
            [](Settings& settings) { settings.putBoolean(Settings::SKS_STREAMING, GetParam()); });
    }

    void recognise() {
        startSession(SHORT_SPEECH);
        play(1100);
    }

    /** Moves the clock on to the second attempt and to its end. */
    void letItRetry() {
        for (int i = 0; i < 150 && !events->waitForEnds(1, std::chrono::milliseconds(20)); ++i) {
            advanceMs(100);
        }
    }
};

TEST_P(RequestReasonTest, IsTheStatus) {
    server.setDefaultAnswer(Answer::status(404));
    recognise();
    expectEnd("ErrorNetwork", "HTTP status 404");
    EXPECT_EQ(session->getErrorStatus(), 404);
    EXPECT_EQ(session->getDeviceError(), std::nullopt);
}

TEST_P(RequestReasonTest, IsEmptyWithoutAnError) {
    recognise();
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts().back(), "results");
    EXPECT_EQ(session->getErrorReason(), "");
    EXPECT_EQ(session->getErrorStatus(), std::nullopt);
}

TEST_P(RequestReasonTest, SaysThatTheServiceIsBusy) {
    server.setDefaultAnswer(Answer::status(503, RETRY_AFTER));
    recognise();
    letItRetry();
    expectEnd("ErrorNetwork", "HTTP status 503 (the service is busy)");
    EXPECT_EQ(server.getRequestCount(), 2U);
}

TEST_P(RequestReasonTest, SaysThatTheServiceIsBusyInTheMiddleOfTheRequest) {
    server.setDefaultAnswer(Answer::status(503, RETRY_AFTER).afterBodyBytes(5000));
    recognise();
    letItRetry();
    expectEnd("ErrorNetwork", "HTTP status 503 (the service is busy)");
    EXPECT_EQ(server.getRequestCount(), 2U);
}

TEST_P(RequestReasonTest, IsThatOfTheLastAttempt) {
    server.script({Answer::status(503, RETRY_AFTER), Answer::status(502)});
    recognise();
    letItRetry();
    expectEnd("ErrorNetwork", "HTTP status 502");
    EXPECT_EQ(session->getErrorStatus(), 502);
}

TEST_P(RequestReasonTest, KeepsNothingOfAnAttemptBeforeTheResults) {
    server.script({Answer::status(503, RETRY_AFTER)});
    recognise();
    letItRetry();
    EXPECT_EQ(events->texts().back(), "results");
    EXPECT_EQ(session->getErrorReason(), "");
}

TEST_P(RequestReasonTest, IsTheNetworkLayersOwn) {
    const TestSupport::RefusingPort port;
    configureText(Settings::SKS_URL, port.getUrl());
    recognise();
    letItRetry();
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(session->getErrorReason().find("Failed to connect to 127.0.0.1 port " +
                                             std::to_string(port.getPort())),
              0U)
        << session->getErrorReason();
    EXPECT_EQ(session->getErrorStatus(), std::nullopt);
}

TEST_P(RequestReasonTest, NamesWhatIsWrongWithTheAddress) {
    configureText(Settings::SKS_URL, "ftp://127.0.0.1");
    recognise();
    expectEnd("ErrorNetwork", "the request cannot be sent: its URL is neither http nor https");
}

TEST_P(RequestReasonTest, AnswerWithoutResults) {
    server.setDefaultAnswer(Answer::status(200));
    recognise();
    expectEnd("ErrorNetwork", "the answer holds no results (HTTP status 200)");
}

TEST_P(RequestReasonTest, AnswerWithResultsThatCannotBeRead) {
    for (const int status : {200, 404}) {
        server.setDefaultAnswer(
            Answer::status(status, {{"x-asrgw-recognition-results", "<not base64>"}}));
        recognise();
        expectEnd("ErrorNetwork", "the results in the answer cannot be read (HTTP status " +
                                      std::to_string(status) + ")");
    }
}

TEST_P(RequestReasonTest, AnswerThatCouldNotBeReadBeforeOneThatIsMissing) {
    server.script({Answer::status(500, {{"x-asrgw-recognition-results", "<not base64>"}}),
                   Answer::status(500)});
    recognise();
    letItRetry();
    expectEnd("ErrorNetwork", "HTTP status 500");
}

TEST_P(RequestReasonTest, NoAnswer) {
    server.setDefaultAnswer(Answer::never());
    recognise();
    ASSERT_TRUE(server.waitForRequest(1));
    advanceMs(20000);
    expectEnd("ErrorNetwork", "no answer within 20 s");
}

TEST_P(RequestReasonTest, NoAnswerAfterAFailure) {
    server.script({Answer::status(503, RETRY_AFTER), Answer::never()});
    recognise();
    for (int i = 0; i < 150 && !server.waitForHead(2, std::chrono::milliseconds(20)); ++i) {
        advanceMs(100);
    }
    advanceMs(20000);
    expectEnd("ErrorNetwork",
              "no answer within 20 s; the first attempt failed: HTTP status 503 (the service is "
              "busy)");
    EXPECT_EQ(session->getErrorStatus(), std::nullopt);
}

TEST_P(RequestReasonTest, BelongsToItsSession) {
    server.setDefaultAnswer(Answer::status(404));
    recognise();
    ASSERT_TRUE(events->waitForEnds());
    const boost::shared_ptr<Talvox::Recognizer> first = session;
    server.setDefaultAnswer(Answer::status(400));
    recognise();
    expectEnd("ErrorNetwork", "HTTP status 400");
    EXPECT_EQ(first->getErrorReason(), "HTTP status 404");
}

INSTANTIATE_TEST_SUITE_P(BothProtocols, RequestReasonTest, ::testing::Bool(),
                         [](const ::testing::TestParamInfo<bool>& parameters) {
                             return std::string(parameters.param ? "Chunked" : "Simple");
                         });

TEST_F(ErrorReasonTest, IsEmptyBeforeTheEnd) {
    startSession(ENDLESS_SPEECH);
    play(500);
    EXPECT_EQ(session->getErrorReason(), "");
}

TEST_F(ErrorReasonTest, StaysWhatItWasAtTheEnd) {
    startSession(NEVER_SPEECH);
    play(5000);
    session->cancel();
    session->start();
    expectEnd("ErrorNoVoice", "no speech within 5 s");
}

TEST_F(ErrorReasonTest, IsInTheLog) {
    const TestSupport::LogCapture log;
    startSession(NEVER_SPEECH);
    play(5000);
    EXPECT_EQ(log.count("Recognizer error reason: no speech within 5 s"), 1U);
}

TEST_F(ErrorReasonTest, Cancel) {
    startSession();
    session->cancel();
    expectEnd("ErrorCanceled", "the application cancelled");
}

TEST_F(ErrorReasonTest, AnotherSession) {
    startSession();
    const auto secondEvents = boost::make_shared<CloudTest::EventRecorder>();
    const auto second =
        engine().createRecognizer(secondEvents, boost::make_shared<Talvox::Settings>());
    second->start();
    EXPECT_EQ(secondEvents->errorReason(), "another session is active");
    EXPECT_EQ(session->getErrorReason(), "");
}

TEST_F(ErrorReasonTest, StartedTwice) {
    startSession();
    session->start();
    expectEnd("ErrorBusy", "the session was started a second time");
}

TEST_F(ErrorReasonTest, SettingsOfTheEngine) {
    configureText(Settings::SKS_URL, "");
    startSession();
    expectEnd("ErrorNetwork", "the engine's setting \"url\" is empty");
    configureText(Settings::SKS_URL, server.getUrl());
    configureText(Settings::SKS_UUID, "");
    startSession();
    expectEnd("ErrorNetwork", "the engine's setting \"uuid\" is empty");
}

TEST_F(ErrorReasonTest, NoNetwork) {
    Network::NetworkManager::getInstance().overrideReachability(
        Network::NetworkManager::UNREACHABLE);
    startSession();
    expectEnd("ErrorNetwork", "there is no network");
}

TEST_F(ErrorReasonTest, RecorderThatDoesNotStart) {
    prepareRecorder = [](ScriptedRecorder& made) { made.works = false; };
    startSession();
    expectEnd("ErrorAudio", "the recorder could not be started");
}

TEST_F(ErrorReasonTest, RecorderThatFails) {
    startSession();
    recorder->fail();
    expectEnd("ErrorAudio", "the recorder failed");
}

TEST_F(ErrorReasonTest, RecorderThatDeliversNothing) {
    startSession();
    advanceMs(10000);
    expectEnd("ErrorAudio", "the recorder delivered no sound for 10 s");
}

TEST_F(ErrorReasonTest, RecorderThatDeliversTooLittle) {
    startSession(ENDLESS_SPEECH);
    play(500);
    for (int i = 0; i < 60; ++i) {
        advanceMs(1000);
        recorder->deliver(CloudTest::makeConstantBuffer(1));
    }
    expectEnd("ErrorAudio", "the recorder delivered less than 20 s of sound in 60 s");
}

TEST_F(ErrorReasonTest, StoppedBeforeTheRecorderRuns) {
    prepareRecorder = [this](ScriptedRecorder& made) {
        made.insideStart = [this] { session->stop(); };
    };
    startSession();
    expectEnd("ErrorAudio", "the recording ended before any sound came");
}

TEST_F(ErrorReasonTest, StoppedBeforeAnySound) {
    startSession();
    session->stop();
    expectEnd("ErrorAudio", "no sound was recorded");
}

TEST_F(ErrorReasonTest, StandIn) {
    events = boost::make_shared<CloudTest::EventRecorder>();
    session = boost::make_shared<Talvox::DummyRecognizer>(
        &engine(), boost::make_shared<const Talvox::Settings>());
    session->addListener(events);
    session->start();
    expectEnd("ErrorNotAvailable", "settings and platform leave no recognition mechanism");
    session->cancel();
    expectEnd("ErrorCanceled", "the application cancelled");
}

}  // namespace
