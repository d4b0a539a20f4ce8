#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <random>

#include "SessionTest.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"

namespace {

using CloudTest::makeDocument;
using CloudTest::SHORT_SPEECH;
using CloudTest::Texts;
using Talvox::Settings;
using TestSupport::Answer;

/** Faults of the network and of the service, met by both kinds of sessions. */
class SessionFaultsTest : public CloudTest::SessionTest,
                          public ::testing::WithParamInterface<bool> {
  protected:
    SessionFaultsTest() {
        configure(
            [](Settings& settings) { settings.putBoolean(Settings::SKS_STREAMING, GetParam()); });
    }

    void recognise() {
        startSession(SHORT_SPEECH);
        play(1100);
    }

    /** Moves the clock on, but not to the answer time-out, until `ends` holds. */
    template <typename Condition>
    void advanceUntil(Condition ends) {
        for (int i = 0; i < 150 && !ends(); ++i) {
            advanceMs(100);
        }
    }

    void expectEnd(const std::string& end) {
        ASSERT_TRUE(events->waitForEnds());
        EXPECT_EQ(events->texts(),
                  (Texts{"recordingBegin", "speakingBegin", "recordingDone", end}));
        EXPECT_TRUE(isEngineFree());
        advanceMs(40000);
        kdDrainEventsKOR();
        EXPECT_EQ(events->countEnds(), 1U);
    }

    /** A stream may fail at any time, so that what was heard before does not count. */
    void expectOnlyError() {
        ASSERT_TRUE(events->waitForEnds());
        EXPECT_EQ(events->texts().back(), "error ErrorNetwork");
        EXPECT_EQ(events->countEnds(), 1U);
        EXPECT_TRUE(isEngineFree());
    }

    Talvox::Recognition::Outcome getOutcome() const { return events->recognition()->getOutcome(); }
};

TEST_P(SessionFaultsTest, ServerErrorAndThenAnAnswer) {
    server.script({Answer::status(500), CloudTest::answerGoForward()});
    recognise();
    ASSERT_TRUE(server.waitForRequest(1));
    advanceUntil([this] { return server.waitForHead(2, std::chrono::milliseconds(20)); });
    expectEnd("results");
    EXPECT_EQ(server.getRequestCount(), 2U);
    EXPECT_EQ(server.getRequest(0).body, server.getRequest(1).body);
}

TEST_P(SessionFaultsTest, ServerErrorTwice) {
    server.setDefaultAnswer(Answer::status(503));
    recognise();
    ASSERT_TRUE(server.waitForRequest(1));
    advanceUntil([this] { return server.waitForHead(2, std::chrono::milliseconds(20)); });
    expectEnd("error ErrorNetwork");
    EXPECT_EQ(server.getRequestCount(), 2U);
}

TEST_P(SessionFaultsTest, ConnectionLostInTheMiddle) {
    server.script({Answer::resetAfter(10000), CloudTest::answerGoForward()});
    recognise();
    ASSERT_TRUE(server.waitForClosed(1));
    advanceUntil([this] { return server.waitForHead(2, std::chrono::milliseconds(20)); });
    expectEnd("results");
}

TEST_P(SessionFaultsTest, NoAnswer) {
    server.setDefaultAnswer(Answer::never());
    recognise();
    ASSERT_TRUE(server.waitForRequest(1));
    advanceMs(19999);
    EXPECT_EQ(events->countEnds(), 0U);
    advanceMs(1);
    EXPECT_EQ(events->timeOf("error ErrorNetwork"), 21100);
    expectEnd("error ErrorNetwork");
}

TEST_P(SessionFaultsTest, NobodyListens) {
    const TestSupport::RefusingPort port;
    configureText(Settings::SKS_URL, port.getUrl());
    recognise();
    advanceUntil([this] { return events->waitForEnds(1, std::chrono::milliseconds(20)); });
    expectEnd("error ErrorNetwork");
}

TEST_P(SessionFaultsTest, AddressThatWouldSplitTheRequest) {
    const std::string url = server.getUrl();
    for (const std::string& bad :
         {url + "/a b", url + "/a\r\nX-Evil: 1", url + "/\x01", std::string("not a url")}) {
        configureText(Settings::SKS_URL, bad);
        recognise();
        expectOnlyError();
    }
    configureText(Settings::SKS_URL, url);
    configureText(Settings::SKS_UUID, "id HTTP/1.1\r\nX-Evil: 1\r\n\r\n");
    recognise();
    expectOnlyError();
    EXPECT_EQ(server.getRequestCount(), 0U);
}

TEST_P(SessionFaultsTest, AnswerWithoutResults) {
    server.setDefaultAnswer(Answer::status(200, {{"x-kvrequestid", "r"}}, "hello"));
    recognise();
    expectEnd("error ErrorNetwork");
}

TEST_P(SessionFaultsTest, RefusalWithoutResults) {
    server.setDefaultAnswer(Answer::status(400));
    recognise();
    expectEnd("error ErrorNetwork");
    EXPECT_EQ(server.getRequestCount(), 1U);
}

TEST_P(SessionFaultsTest, ResultsThatAreNotBase64) {
    server.setDefaultAnswer(
        Answer::status(200, {{"x-asrgw-recognition-results", "<recognitionResults/>"}}));
    recognise();
    expectEnd("error ErrorNetwork");
}

TEST_P(SessionFaultsTest, BrokenAndHostileDocuments) {
    std::string deep = "<recognitionResults success=\"1\">";
    for (int i = 0; i < 5000; ++i) {
        deep += "<a>";
    }
    for (const std::string& document :
         {std::string("<recognitionResults success=\"1\"><variant>go"), deep,
          std::string("\xFF\xFE<a/>"), std::string("<variant>\xE2\x82"), std::string("go")}) {
        server.setDefaultAnswer(CloudTest::answerDocument(document));
        recognise();
        expectEnd("error ErrorNetwork");
    }
}

TEST_P(SessionFaultsTest, HeaderBeyondEveryLimit) {
    server.setDefaultAnswer(CloudTest::answerDocument(std::string(std::size_t{10} << 20, 'x')));
    recognise();
    ASSERT_TRUE(server.waitForRequest(1));
    advanceUntil([this] { return server.waitForHead(2, std::chrono::milliseconds(20)); });
    expectEnd("error ErrorNetwork");
}

TEST_P(SessionFaultsTest, ServiceThatUnderstoodNothing) {
    server.setDefaultAnswer(CloudTest::answerDocument("<recognitionResults success=\"0\"/>"));
    recognise();
    expectEnd("results");
    EXPECT_TRUE(events->recognition()->getResults()->empty());
    EXPECT_EQ(getOutcome(), Talvox::Recognition::OutcomeUncertain);
}

TEST_P(SessionFaultsTest, ConfidencesOfAllKinds) {
    const std::vector<std::pair<std::string, Talvox::Recognition::Outcome>> cases = {
        {"0.95", Talvox::Recognition::OutcomeAccepted},
        {"0.6", Talvox::Recognition::OutcomeUncertain},
        {"-0.5", Talvox::Recognition::OutcomeRejected},
        {"-1", Talvox::Recognition::OutcomeAccepted},
        {"high", Talvox::Recognition::OutcomeRejected},
    };
    for (const auto& expected : cases) {
        server.setDefaultAnswer(CloudTest::answerDocument(makeDocument({{"go", expected.first}})));
        recognise();
        expectEnd("results");
        EXPECT_EQ(getOutcome(), expected.second) << expected.first;
    }
}

TEST_P(SessionFaultsTest, AsManyVariantsAsAHeaderHolds) {
    constexpr int COUNT = 1200;
    std::vector<std::pair<std::string, std::string>> variants;
    variants.reserve(COUNT);
    for (int i = 0; i < COUNT; ++i) {
        variants.emplace_back("w" + std::to_string(i), "0.5");
    }
    server.setDefaultAnswer(CloudTest::answerDocument(makeDocument(variants)));
    recognise();
    expectEnd("results");
    EXPECT_EQ(events->recognition()->getResults()->size(), static_cast<std::size_t>(COUNT));
}

TEST_P(SessionFaultsTest, DroppedWhileNobodyAnswers) {
    server.setDefaultAnswer(Answer::never());
    recognise();
    ASSERT_TRUE(server.waitForRequest(1));
    session.reset();
    EXPECT_TRUE(isEngineFree());
    EXPECT_TRUE(server.waitForClosed(1));
    advanceMs(40000);
    EXPECT_EQ(events->countEnds(), 0U);
}

/** Calls in any order against faults of any kind: one end at most, and nothing after it. */
TEST_P(SessionFaultsTest, RandomCalls) {
    std::mt19937 random(GetParam() ? 1 : 2);
    const auto pick = [&random](int count) { return static_cast<int>(random() % count); };
    for (int round = 0; round < 60; ++round) {
        const Answer answers[] = {CloudTest::answerGoForward(),
                                  Answer::status(500),
                                  Answer::status(404),
                                  Answer::never(),
                                  Answer::closing(),
                                  Answer::resetAfter(5000),
                                  CloudTest::answerGoForward().onHead()};
        server.setDefaultAnswer(answers[pick(7)]);
        configureText(Settings::SKS_SOUND_FORMAT,
                      pick(2) == 0 ? Settings::SOUND_FORMAT_PCM : Settings::SOUND_FORMAT_SPEEX);
        prepareRecorder = [&pick](CloudTest::ScriptedRecorder& made) {
            made.works = pick(10) != 0;
            made.failsAtStart = pick(10) == 0;
        };
        configureText(Settings::SKS_VAD_SETTINGS, SHORT_SPEECH);
        makeSession();
        recorder.reset();
        for (int step = 0; step < 12 && session; ++step) {
            switch (pick(9)) {
                case 0:
                    session->stop();
                    break;
                case 1:
                    if (pick(3) == 0) {
                        session->cancel();
                    }
                    break;
                case 2:
                    if (recorder && pick(4) == 0) {
                        recorder->fail();
                    }
                    break;
                case 3:
                    advanceMs(pick(3000));
                    break;
                case 4:
                    kdDrainEventsKOR();
                    break;
                case 5:
                    if (pick(5) == 0) {
                        session.reset();
                    }
                    break;
                case 6:
                    if (!recorder || pick(5) == 0) {
                        session->start();
                    }
                    break;
                default:
                    if (recorder) {
                        play(100 * pick(8));
                    }
                    break;
            }
        }
        if (session) {
            session->cancel();
        }
        const Texts texts = events->texts();
        ASSERT_LE(events->countEnds(), 1U) << round;
        if (session) {
            ASSERT_EQ(events->countEnds(), 1U) << round;
            ASSERT_TRUE(texts.back() == "results" || texts.back().rfind("error", 0) == 0) << round;
        }
        ASSERT_TRUE(isEngineFree()) << round;
        session.reset();
        advanceMs(40000);
        ASSERT_EQ(events->texts(), texts) << round;
    }
}

INSTANTIATE_TEST_SUITE_P(BothProtocols, SessionFaultsTest, ::testing::Bool(),
                         [](const ::testing::TestParamInfo<bool>& parameters) {
                             return std::string(parameters.param ? "Chunked" : "Simple");
                         });

}  // namespace
