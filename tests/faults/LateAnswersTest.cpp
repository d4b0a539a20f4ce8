#include <gtest/gtest.h>

#include <tuple>

#include "Answers.h"
#include "FaultSession.h"

namespace FaultTest {

namespace {

using CloudTest::answerDocument;
using CloudTest::makeDocument;
using TestSupport::Answer;

const std::string OLD = makeDocument({{"old words", "0.95"}});
const std::string NEW = makeDocument({{"new words", "0.95"}});

enum class Way { CANCELLED, TIMED_OUT, RELEASED };
enum class When { BEFORE, WHILE_SPEAKING, DURING, AFTER };

/** The answer to a session that is over never reaches the next one. */
class LateAnswersTest : public FaultSession,
                        public ::testing::WithParamInterface<std::tuple<bool, Way, When>> {
  protected:
    LateAnswersTest() { setChunked(std::get<0>(GetParam())); }

    static Way way() { return std::get<1>(GetParam()); }
    static When when() { return std::get<2>(GetParam()); }

    /** A session whose request is with the server when it ends. */
    void runFirst() {
        server->script({answerDocument(OLD).held()});
        start();
        stepTo(3500);
        ASSERT_TRUE(server->getRequest(0).complete);
        if (way() == Way::TIMED_OUT) {
            EXPECT_EQ("error ErrorNetwork", finish().end);
        } else if (way() == Way::CANCELLED) {
            session->cancel();
            EXPECT_EQ("error ErrorCanceled", events->texts().back());
        }
        firstEvents = events;
        firstTexts = events->texts();
        session.reset();
        rest();
    }

    /** The next one, with the first one's answer on its way. */
    SessionOutcome runSecond() {
        if (when() == When::BEFORE) {
            server->release();
        }
        Answer answer = answerDocument(NEW);
        if (when() == When::DURING) {
            answer = answer.inPieces(16);
            onStep = [this] {
                if (server->getRequest(1).complete) {
                    server->release(1000);
                }
            };
        } else if (when() == When::WHILE_SPEAKING) {
            onStep = [this] {
                if (elapsedMs() == 1500) {
                    server->release();
                }
            };
        }
        server->setDefaultAnswer(answer);
        return run();
    }

    boost::shared_ptr<CloudTest::EventRecorder> firstEvents;
    std::vector<std::string> firstTexts;
};

TEST_P(LateAnswersTest, StayWithTheirSession) {
    runFirst();
    const SessionOutcome outcome = runSecond();
    EXPECT_EQ("results (new words)", outcome.end) << outcome.events;
    EXPECT_EQ(1U, outcome.attempts);
    if (when() == When::AFTER) {
        server->release();
        rest();
        advanceMs(60000);
        rest();
    }
    EXPECT_EQ(1U, events->countEnds());
    EXPECT_EQ(firstTexts, firstEvents->texts());
    EXPECT_EQ(2U, server->getRequestCount());
    // What is still owed to one request is never left to the next.
    EXPECT_NE(server->getRequest(0).connection, server->getRequest(1).connection);
}

using Parameters = ::testing::TestParamInfo<std::tuple<bool, Way, When>>;

std::string nameOf(const Parameters& parameters) {
    const char* const ways[] = {"Cancelled", "TimedOut", "Released"};
    const char* const times[] = {"Before", "WhileSpeaking", "During", "After"};
    return std::string(std::get<0>(parameters.param) ? "Chunked" : "Simple") +
           ways[static_cast<int>(std::get<1>(parameters.param))] +
           times[static_cast<int>(std::get<2>(parameters.param))];
}

INSTANTIATE_TEST_SUITE_P(Sessions, LateAnswersTest,
                         ::testing::Combine(::testing::Bool(),
                                            ::testing::Values(Way::CANCELLED, Way::TIMED_OUT,
                                                              Way::RELEASED),
                                            ::testing::Values(When::BEFORE, When::WHILE_SPEAKING,
                                                              When::DURING, When::AFTER)),
                         &nameOf);

std::string textOfOld() {
    return "HTTP/1.1 200 OK\r\nx-asrgw-recognition-results: " + encode(OLD) +
           "\r\nContent-Length: 0\r\n\r\n";
}

/** Answers that nobody asked for, on a connection that is kept for the next session. */
class StrayAnswersTest : public FaultSession, public ::testing::WithParamInterface<bool> {
  protected:
    StrayAnswersTest() { setChunked(GetParam()); }

    /** A session with an answer, after which another one follows when the test lets it go. */
    void runFirst(const std::string& stray) {
        const std::string first = textOfGoForward(std::string(1000, ' '));
        ASSERT_LE(stray.size(), first.size());
        server->script({Answer::raw(first + stray).inPieces(first.size())});
        onStep = [this] {
            if (server->getRequest(0).complete && events->countEnds() == 0) {
                server->release();
            }
        };
        EXPECT_EQ("results (go forward)", run().end);
        onStep = {};
        server->setDefaultAnswer(answerDocument(NEW));
    }
};

TEST_P(StrayAnswersTest, BeforeTheNextSessionAreNotTakenForIts) {
    runFirst(textOfOld());
    server->release();
    rest();
    EXPECT_EQ("results (new words)", run().end);
    EXPECT_EQ("results (new words)", run().end);
}

TEST_P(StrayAnswersTest, ThatEndAnIdleConnectionDoNotEndTheNextSession) {
    runFirst("HTTP/1.1 408 Request Timeout\r\nContent-Length: 0\r\n\r\n");
    server->release();
    rest();
    EXPECT_EQ("results (new words)", run().end);
}

TEST_P(StrayAnswersTest, InTheSamePacketAreNotTakenForTheNext) {
    server->script({Answer::raw(textOfGoForward() + textOfOld())});
    EXPECT_EQ("results (go forward)", run().end);
    server->setDefaultAnswer(answerDocument(NEW));
    EXPECT_EQ("results (new words)", run().end);
}

INSTANTIATE_TEST_SUITE_P(Sessions, StrayAnswersTest, ::testing::Bool(),
                         [](const ::testing::TestParamInfo<bool>& parameters) {
                             return std::string(parameters.param ? "Chunked" : "Simple");
                         });

}  // namespace

}  // namespace FaultTest
