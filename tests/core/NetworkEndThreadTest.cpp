#include <future>
#include <thread>

#include "NetworkFixture.h"

using Network::NetworkTaskHolder;

namespace {

/** Where a task's operations run, by thread. */
class NetworkEndThreadTest : public NetworkFixture {
  protected:
    /** Runs one task to its end. */
    void run(NetworkTaskHolder& owner, const std::string& url) {
        const auto task = makeTask(url);
        task->setHook("issue", [this] { issuedOn = std::this_thread::get_id(); });
        task->setHook("finished", [this] { finishedOn = std::this_thread::get_id(); });
        owner.submitNoRetries(task);
        ASSERT_NE("", task->waitForEnd());
        const Util::EventLock afterTheHook;
    }

    static std::thread::id eventThread() {
        std::promise<std::thread::id> id;
        kdPostKOR(
            [](void* user) {
                static_cast<std::promise<std::thread::id>*>(user)->set_value(
                    std::this_thread::get_id());
            },
            &id);
        return id.get_future().get();
    }

    std::thread::id issuedOn;
    std::thread::id finishedOn;
};

TEST_F(NetworkEndThreadTest, IsTheEventThreadByDefault) {
    run(holder, server.getUrl());
    EXPECT_EQ(eventThread(), finishedOn);
    EXPECT_NE(issuedOn, finishedOn);
}

TEST_F(NetworkEndThreadTest, IsTheNetworkThreadWhereTheHolderIsMadeForIt) {
    NetworkTaskHolder direct(NetworkTaskHolder::EndThread::NETWORK);
    for (const std::string& url : {server.getUrl(), std::string("nonsense")}) {
        finishedOn = std::thread::id();
        run(direct, url);
        EXPECT_EQ(issuedOn, finishedOn) << url;
        EXPECT_NE(eventThread(), finishedOn) << url;
    }
}

TEST_F(NetworkEndThreadTest, TheNextTaskMayBeSubmittedFromTheEndOfTheLast) {
    NetworkTaskHolder direct(NetworkTaskHolder::EndThread::NETWORK);
    const auto second = makeTask(server.getUrl());
    const auto first = makeTask(server.getUrl());
    first->setHook("finished", [&] {
        direct.onFinished();
        direct.submitNoRetries(second);
    });
    direct.submitNoRetries(first);
    EXPECT_EQ("finished 200", second->waitForEnd());
    EXPECT_EQ(1U, server.getConnectionCount());
}

}  // namespace
