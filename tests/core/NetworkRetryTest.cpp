#include <limits>

#include "NetworkFixture.h"
#include "core/network/NetworkTaskRetryPolicy.h"

using Network::NetworkTaskBasicRetryPolicy;
using Network::NetworkTaskWriter;
using ::testing::ElementsAre;
using TestSupport::Answer;

namespace {

using NetworkRetryTest = NetworkFixture;

TEST_F(NetworkRetryTest, TriesAgainAfterAServerErrorAndThePause) {
    server.script({Answer::status(500, {}, "no"), Answer::status(200, {}, "yes")});
    const auto task = makeUpload(server.getUrl(), "the body");
    holder.submit(task, retry(2000, 2));
    ASSERT_TRUE(task->waitFor("response 500"));
    settle();
    advanceMs(1999);
    settle();
    EXPECT_EQ(1U, server.getRequestCount());
    EXPECT_TRUE(holder.isWorking());
    advanceMs(1);
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_THAT(task->getEvents(),
                ElementsAre("ready?", "issue", "response 500", "bytes 2", "retried", "issue",
                            "response 200", "bytes 3", "finished 200"));
    EXPECT_EQ(server.getRequest(0).head, server.getRequest(1).head);
    EXPECT_EQ("the body", server.getRequest(1).body);
}

TEST_F(NetworkRetryTest, GivesUpAfterTheLastAttempt) {
    server.setDefaultAnswer(Answer::status(503));
    const auto task = makeTask(server.getUrl());
    holder.submit(task, retry(0, 3));
    EXPECT_EQ("finished 503", task->waitForEnd());
    EXPECT_EQ(3U, server.getRequestCount());
}

TEST_F(NetworkRetryTest, DoesNotRepeatWhatIsFinal) {
    server.setDefaultAnswer(Answer::status(404));
    const auto task = makeTask(server.getUrl());
    holder.submit(task, retry(0, 3));
    EXPECT_EQ("finished 404", task->waitForEnd());
    EXPECT_EQ(1U, server.getRequestCount());
}

TEST_F(NetworkRetryTest, TriesAgainWhenNobodyListens) {
    const TestSupport::RefusingPort port;
    const auto task = makeTask(port.getUrl());
    holder.submit(task, retry(0, 3));
    EXPECT_EQ("finished -1", task->waitForEnd());
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue", "retried", "issue", "retried",
                                               "issue", "finished -1"));
}

TEST_F(NetworkRetryTest, DoesNotRepeatARequestThatCannotBeMade) {
    const auto task = makeTask("not a url");
    holder.submit(task, retry(0, 3));
    EXPECT_EQ("finished -4", task->waitForEnd());
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue", "finished -4"));
}

TEST_F(NetworkRetryTest, SendsAStreamAgainFromItsBeginningAndGoesOn) {
    server.script({Answer::resetAfter(7)});
    const auto writer = boost::make_shared<NetworkTaskWriter>();
    const auto task = makeStream(server.getUrl(), writer);
    holder.submit(task, retry(2000, 2));
    write(*writer, "first ");
    write(*writer, "second ");
    ASSERT_TRUE(server.waitForClosed(1));
    write(*writer, "third ");
    // The broken connection shows at the latest with a write that follows.
    for (int i = 0; i < 100 && server.getRequestCount() == 1; ++i) {
        settle();
        advanceMs(2000);
        settle();
    }
    ASSERT_TRUE(server.waitForBody(1, 19));
    write(*writer, "fourth");
    writer->close();
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ("first second third fourth", server.getRequest(1).body);
    EXPECT_TRUE(server.getRequest(1).complete);
}

TEST_F(NetworkRetryTest, StreamsIntoThePauseWithoutLosingAWord) {
    server.script({Answer::status(503).onHead().thenClose()});
    const auto writer = boost::make_shared<NetworkTaskWriter>();
    const auto task = makeStream(server.getUrl(), writer);
    holder.submit(task, retry(2000, 2));
    ASSERT_TRUE(task->waitFor("response 503"));
    write(*writer, "written while nobody sends");
    writer->close();
    settle();
    settle();
    advanceMs(2000);
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ("written while nobody sends", server.getRequest(1).body);
}

TEST_F(NetworkRetryTest, IsSilencedByACancelInThePause) {
    server.script({Answer::status(500)});
    const auto task = makeTask(server.getUrl());
    holder.submit(task, retry(2000, 2));
    ASSERT_TRUE(task->waitFor("response 500"));
    settle();
    holder.cancel();
    const auto events = task->getEvents();
    advanceMs(10000);
    settle();
    EXPECT_EQ(events, task->getEvents());
    EXPECT_EQ(1U, server.getRequestCount());
}

TEST_F(NetworkRetryTest, AsksThePolicyWithCodeAndAttempt) {
    class Policy : public Network::NetworkTaskRetryPolicy {
      public:
        int64_t getRetryDelayMs(int code, int attempts) const override {
            asked.emplace_back(code, attempts);
            return attempts < 3 ? 0 : -1;
        }
        mutable std::vector<std::pair<int, int>> asked;
    };
    server.script({Answer::status(404).thenClose(), Answer::closing(), Answer::status(200)});
    const auto policy = boost::make_shared<Policy>();
    const auto task = makeTask(server.getUrl());
    holder.submit(task, policy);
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_THAT(policy->asked,
                ElementsAre(std::make_pair(404, 1), std::make_pair(-1, 2), std::make_pair(200, 3)));
}

TEST(NetworkTaskBasicRetryPolicyTest, RepeatsWhatAnotherAttemptCanMend) {
    const NetworkTaskBasicRetryPolicy policy(2000, 2, false);
    for (const int code : {-1, -2, 500, 503, 599}) {
        EXPECT_EQ(2000, policy.getRetryDelayMs(code, 1)) << code;
        EXPECT_EQ(-1, policy.getRetryDelayMs(code, 2)) << code;
    }
    for (const int code : {-3, -4, 0, 200, 204, 301, 400, 404, 499, 600}) {
        EXPECT_EQ(-1, policy.getRetryDelayMs(code, 1)) << code;
    }
}

TEST(NetworkTaskBasicRetryPolicyTest, DoublesThePauseWhenAsked) {
    const NetworkTaskBasicRetryPolicy policy(100, 5, true);
    EXPECT_EQ(100, policy.getRetryDelayMs(500, 1));
    EXPECT_EQ(200, policy.getRetryDelayMs(500, 2));
    EXPECT_EQ(400, policy.getRetryDelayMs(500, 3));
    EXPECT_EQ(800, policy.getRetryDelayMs(500, 4));
    EXPECT_EQ(-1, policy.getRetryDelayMs(500, 5));
}

TEST(NetworkTaskBasicRetryPolicyTest, SurvivesAbsurdNumbers) {
    const int most = std::numeric_limits<int>::max();
    const NetworkTaskBasicRetryPolicy endless(most, most, true);
    EXPECT_EQ(int64_t{24} * 60 * 60 * 1000, endless.getRetryDelayMs(500, 1000000));
    const NetworkTaskBasicRetryPolicy negative(-5, -5, false);
    EXPECT_EQ(-1, negative.getRetryDelayMs(500, 1));
    EXPECT_EQ(0, NetworkTaskBasicRetryPolicy(-5, 2, true).getRetryDelayMs(500, 1));
}

}  // namespace
