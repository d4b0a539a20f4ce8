// Tasks that throw: the task ends, nothing is left behind, and the next one works.
#include <gmock/gmock.h>

#include <stdexcept>
#include <string>

#include "NetworkFixture.h"
#include "support/LogCapture.h"

namespace {

[[noreturn]] void throwError() {
    throw std::runtime_error("broken");
}

/** The operation that throws. */
class NetworkExceptions : public NetworkFixture, public ::testing::WithParamInterface<const char*> {
  protected:
    void expectAnAnswer() {
        const auto task = makeTask(server.getUrl());
        holder.submitNoRetries(task);
        EXPECT_EQ("finished 200", task->waitForEnd());
    }

    TestSupport::LogCapture log;
};

TEST_P(NetworkExceptions, EndsTheTaskWithTheReason) {
    server.setDefaultAnswer(TestSupport::Answer::status(200, {}, "body"));
    const auto task = makeTask(server.getUrl());
    task->setByParts(true);
    task->setHook(GetParam(), &throwError);
    holder.submitNoRetries(task);
    EXPECT_EQ("finished -1", task->waitForEnd());
    settle();
    EXPECT_EQ("broken", task->getFailureReason());
    EXPECT_FALSE(holder.isWorking());
    EXPECT_TRUE(log.contains("Network: a task cannot go on: broken"));
    expectAnAnswer();
}

INSTANTIATE_TEST_SUITE_P(Operations, NetworkExceptions,
                         ::testing::Values("ready?", "issue", "response", "bytes"));

class NetworkExceptionsAtTheEnd : public NetworkExceptions {};

TEST_F(NetworkExceptionsAtTheEnd, FreeTheHolderAndAreReported) {
    const auto task = makeTask(server.getUrl());
    task->setHook("finished", &throwError);
    holder.submitNoRetries(task);
    EXPECT_EQ("finished 200", task->waitForEnd());
    settle();
    EXPECT_FALSE(holder.isWorking());
    EXPECT_TRUE(log.contains("PAL: an exception ended a callback: broken"));
    expectAnAnswer();
}

TEST_F(NetworkExceptionsAtTheEnd, FreeAHolderOfTheNetworkThread) {
    Network::NetworkTaskHolder other(Network::NetworkTaskHolder::EndThread::NETWORK);
    const auto task = makeTask(server.getUrl());
    task->setHook("finished", &throwError);
    other.submitNoRetries(task);
    EXPECT_EQ("finished 200", task->waitForEnd());
    settle();
    EXPECT_FALSE(other.isWorking());
    EXPECT_TRUE(log.contains("Network: a task cannot go on: broken"));
    expectAnAnswer();
}

}  // namespace
