#include "logcollector/impl/LogSender.h"

#include <memory>

#include "LogFixture.h"
#include "core/network/NetworkManager.h"
#include "core/util/EventLock.h"
#include "logcollector/impl/LogCollectorNetworkTask.h"

using LogCollector::LogSender;
using ::testing::ElementsAre;
using TestSupport::Answer;

namespace {

constexpr int64_t RETRY_MS = 3000;
constexpr int64_t TIMER_MS = 20000;
/** Below the time-out of a request. */
constexpr int RETRIES_OF_A_STEP = 9;

/** A sender of the test's own, whose state can be asked; the collector lends it its address. */
class LogSenderTest : public LogFixture {
  protected:
    LogSenderTest() : sender(std::make_unique<LogSender>()) {
        sender->setDeliveredCallback([this] { delivered.raise(); });
    }
    ~LogSenderTest() override { sender.reset(); }

    /** In one go: until the last is there, none is found to have been the last one. */
    void send(const std::vector<std::string>& texts) {
        const Util::EventLock lock;
        for (const std::string& text : texts) {
            sender->sendLogRecord(text);
        }
    }

    /** Gives the retry policy the time that it wants until the endpoint has had `count` requests.
     */
    bool retryUntilRequest(std::size_t count) {
        for (int i = 0; i < RETRIES_OF_A_STEP; ++i) {
            if (server.waitForHead(count, std::chrono::milliseconds(i == 0 ? 0 : 100))) {
                return true;
            }
            advanceMs(RETRY_MS);
        }
        return server.waitForHead(count);
    }

    std::unique_ptr<LogSender> sender;
};

TEST_F(LogSenderTest, SendsOneAfterTheOtherInTheirOrder) {
    server.setDefaultAnswer(Answer::status(200).held());
    send({"a", "b", "c"});
    ASSERT_TRUE(server.waitForRequest(1));
    EXPECT_EQ(3U, sender->getPendingCount());
    EXPECT_EQ(1U, server.getRequestCount());
    server.release(3);
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_THAT(records(), ElementsAre("a", "b", "c"));
    EXPECT_EQ(1U, server.getConnectionCount());
    EXPECT_FALSE(sender->isWorking());
    EXPECT_FALSE(sender->isTimerRunning());
}

TEST_F(LogSenderTest, AppendsAFailedRecordBehindThoseQueuedBefore) {
    server.script({Answer::status(404).held()});
    send({"a", "b", "c"});
    ASSERT_TRUE(server.waitForRequest(1));
    server.release();
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_THAT(records(), ElementsAre("a", "b", "c", "a"));
    EXPECT_EQ(1U, log.count(FAILURE));
}

TEST_F(LogSenderTest, TakesOnly200ForASuccess) {
    for (const int status : {201, 202, 204, 206, 301, 400, 404, 414, 499}) {
        const std::size_t before = server.getRequestCount();
        log.clear();
        server.script({Answer::status(status, {{"Location", "/elsewhere"}})});
        send({"r" + std::to_string(status)});
        // The front of the queue, this record, is tried at once.
        ASSERT_TRUE(delivered.waitFor(before / 2 + 1)) << status;
        EXPECT_EQ(before + 2, server.getRequestCount()) << status;
        EXPECT_EQ(recordOf(before), recordOf(before + 1));
        EXPECT_EQ(1U, log.count(FAILURE)) << status;
        advanceMs(RETRY_MS);
    }
}

TEST_F(LogSenderTest, HasTheNetworkRepeatARequestBeforeItFails) {
    server.script({Answer::status(500), Answer::status(503)});
    send({"a"});
    ASSERT_TRUE(server.waitForHead(1));
    send({"b"});
    ASSERT_TRUE(retryUntilRequest(2));
    ASSERT_TRUE(log.waitFor(FAILURE));
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_THAT(records(), ElementsAre("a", "a", "b", "a"));
    EXPECT_EQ(1U, log.count(FAILURE));
}

TEST_F(LogSenderTest, IsSilentAboutAnAttemptThatTheNextOneMends) {
    server.script({Answer::resetAfter(0)});
    send({"a"});
    ASSERT_TRUE(retryUntilRequest(2));
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_THAT(records(), ElementsAre("a", "a"));
    EXPECT_EQ(0U, log.count(FAILURE));
}

TEST_F(LogSenderTest, StartsTheTimerWithAFailureAndEndsItWhenTheQueueIsEmpty) {
    server.script({Answer::status(404).held(), Answer::status(200).held()});
    send({"a"});
    ASSERT_TRUE(server.waitForRequest(1));
    EXPECT_FALSE(sender->isTimerRunning());
    server.release();
    ASSERT_TRUE(log.waitFor(FAILURE));
    ASSERT_TRUE(server.waitForRequest(2));
    EXPECT_TRUE(sender->isTimerRunning());
    server.release();
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_FALSE(sender->isTimerRunning());
}

TEST_F(LogSenderTest, LeavesARunningRequestAloneWhenTheTimerFires) {
    server.script({Answer::status(404), Answer::status(200).held()});
    send({"a", "b"});
    ASSERT_TRUE(server.waitForRequest(2));
    ASSERT_TRUE(sender->isTimerRunning());
    advanceMs(TIMER_MS);
    EXPECT_EQ(2U, sender->getPendingCount());
    EXPECT_EQ(2U, server.getRequestCount());
    server.release();
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_THAT(records(), ElementsAre("a", "b", "a"));
}

TEST_F(LogSenderTest, ReportsARequestThatTheEndpointLetsPass) {
    server.script({Answer::never(), Answer::never()});
    send({"a"});
    ASSERT_TRUE(server.waitForRequest(1));
    advanceMs(LogCollector::LogCollectorNetworkTask::TIMEOUT_MS - 1);
    EXPECT_EQ(1U, server.getRequestCount());
    advanceMs(1);
    ASSERT_TRUE(retryUntilRequest(2));
    advanceMs(LogCollector::LogCollectorNetworkTask::TIMEOUT_MS);
    ASSERT_TRUE(log.waitFor(FAILURE));
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_THAT(records(), ElementsAre("a", "a", "a"));
}

TEST_F(LogSenderTest, SendsNothingTwiceAtATime) {
    server.setDefaultAnswer(Answer::status(200).held());
    send({"a"});
    sender->sendNextRecord();
    send({"b"});
    sender->sendNextRecord();
    ASSERT_TRUE(server.waitForRequest(1));
    EXPECT_EQ(2U, sender->getPendingCount());
    server.release();
    ASSERT_TRUE(server.waitForRequest(2));
    server.release();
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_THAT(records(), ElementsAre("a", "b"));
}

TEST_F(LogSenderTest, IgnoresTheBodyOfAnAnswer) {
    server.script({Answer::status(200, {}, std::string(100000, 'x'))});
    send({"a", "b"});
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_THAT(records(), ElementsAre("a", "b"));
}

TEST_F(LogSenderTest, UsesTheAddressOfTheMomentOfAnAttempt) {
    TestSupport::ScriptedHttpServer second;
    server.script({Answer::status(500)});
    send({"a"});
    ASSERT_TRUE(server.waitForRequest(1));
    LogCollector::configure("other", second.getUrl());
    for (int i = 0; i < RETRIES_OF_A_STEP && second.getRequestCount() == 0; ++i) {
        advanceMs(RETRY_MS);
        second.waitForHead(1, std::chrono::milliseconds(100));
    }
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_EQ("GET /?uuid=other&logmessage=a HTTP/1.1", second.getRequest(0).line());
}

TEST_F(LogSenderTest, EndsInTheMiddleOfARequest) {
    server.setDefaultAnswer(Answer::never());
    send({"a", "b"});
    ASSERT_TRUE(server.waitForRequest(1));
    sender.reset();
    ASSERT_TRUE(server.waitForClosed(1));
    advanceMs(10 * TIMER_MS);
    EXPECT_EQ(1U, server.getRequestCount());
    EXPECT_EQ(0U, log.count(FAILURE));
}

TEST_F(LogSenderTest, EndsInTheMiddleOfARetry) {
    server.setDefaultAnswer(Answer::resetAfter(0));
    send({"a", "b"});
    ASSERT_TRUE(retryUntilRequest(2));
    ASSERT_TRUE(log.waitForPart(NETWORK_FAILURE, 3));
    settle();
    EXPECT_TRUE(sender->isWorking());
    sender.reset();
    advanceMs(10 * TIMER_MS);
    EXPECT_EQ(3U, server.getRequestCount());
}

TEST_F(LogSenderTest, EndsWhileItHoldsBack) {
    server.setDefaultAnswer(Answer::status(404));
    send({"a", "b"});
    ASSERT_TRUE(log.waitFor(FAILURE, 2));
    sender.reset();
    advanceMs(10 * TIMER_MS);
    EXPECT_EQ(2U, server.getRequestCount());
}

TEST_F(LogSenderTest, EndsWithTheNetwork) {
    server.setDefaultAnswer(Answer::never());
    LogCollector::startSession("id");
    LogCollector::logEvent("id", "name", {});
    send({"a"});
    ASSERT_TRUE(server.waitForRequest(2));
    sender.reset();
    // The collector first, then the network: nothing makes either of them again.
    Util::SingletonStorage::destroyAll();
    EXPECT_EQ(0U, log.count(FAILURE));
    EXPECT_EQ(0U, LogCollector::getPendingCount());
}

}  // namespace
