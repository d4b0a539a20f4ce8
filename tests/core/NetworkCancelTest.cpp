#include <future>
#include <random>
#include <thread>

#include "NetworkFixture.h"
#include "support/AssertCapture.h"

using Network::NetworkTaskHolder;
using Network::NetworkTaskWriter;
using ::testing::ElementsAre;
using TestSupport::Answer;

namespace {

using NetworkCancelTest = NetworkFixture;

TEST_F(NetworkCancelTest, EndsTheTransferAndSilencesTheTask) {
    server.script({Answer::never()});
    const auto task = makeTask(server.getUrl());
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForRequest(1));
    EXPECT_TRUE(holder.isWorking());
    holder.cancel();
    EXPECT_FALSE(holder.isWorking());
    EXPECT_TRUE(server.waitForClosed(1));
    settle();
    advanceMs(int64_t{10} * REQUEST_TIMEOUT_MS);
    settle();
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue"));
}

TEST_F(NetworkCancelTest, ReleasesTheTaskAtOnce) {
    server.script({Answer::never()});
    auto task = makeTask(server.getUrl());
    const boost::weak_ptr<RecordingTask> weak(task);
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForRequest(1));
    task.reset();
    EXPECT_FALSE(weak.expired());
    holder.cancel();
    EXPECT_TRUE(weak.expired());
}

TEST_F(NetworkCancelTest, ReleasesTheTaskAtItsEnd) {
    auto task = makeTask(server.getUrl());
    const boost::weak_ptr<RecordingTask> weak(task);
    holder.submitNoRetries(task);
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ(0, kdDrainEventsKOR());
    EXPECT_FALSE(holder.isWorking());
    task.reset();
    EXPECT_TRUE(weak.expired());
}

TEST_F(NetworkCancelTest, DoesNothingWithoutATask) {
    holder.cancel();
    holder.onFinished();
    EXPECT_FALSE(holder.isWorking());
}

TEST_F(NetworkCancelTest, IsDoneByTheDestructor) {
    server.script({Answer::never()});
    const auto task = makeTask(server.getUrl());
    {
        NetworkTaskHolder temporary;
        temporary.submitNoRetries(task);
        ASSERT_TRUE(server.waitForRequest(1));
    }
    EXPECT_TRUE(server.waitForClosed(1));
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue"));
}

TEST_F(NetworkCancelTest, SilencesAnEndThatIsOnItsWay) {
    const auto task = makeTask(server.getUrl());
    {
        const Util::EventLock lock;
        holder.submitNoRetries(task);
        holder.cancel();
    }
    settle();
    EXPECT_EQ(0, kdDrainEventsKOR());
    EXPECT_TRUE(task->getEvents().empty());
}

TEST_F(NetworkCancelTest, MayHappenInsideEveryCallback) {
    for (const std::string operation : {"ready?", "issue", "response", "bytes", "finished"}) {
        for (const bool byParts : {false, true}) {
            server.script({Answer::status(200, {}, "body")});
            const auto task = makeTask(server.getUrl());
            task->setByParts(byParts);
            task->setHook(operation, [this] { holder.cancel(); });
            holder.submitNoRetries(task);
            ASSERT_TRUE(task->waitFor(operation));
            settle();
            EXPECT_EQ(0, kdDrainEventsKOR());
            EXPECT_EQ(operation, task->getEvents().back().substr(0, operation.size()));
            EXPECT_FALSE(holder.isWorking());
        }
    }
}

TEST_F(NetworkCancelTest, MayDestroyTheHolderInsideEveryCallback) {
    for (const std::string operation : {"ready?", "issue", "response", "bytes", "finished"}) {
        server.script({Answer::status(200, {}, "body")});
        auto owned = boost::make_shared<NetworkTaskHolder>();
        auto task = makeTask(server.getUrl());
        task->setHook(operation, [&owned] { owned.reset(); });
        owned->submitNoRetries(task);
        ASSERT_TRUE(task->waitFor(operation));
        settle();
        EXPECT_EQ(0, kdDrainEventsKOR());
        EXPECT_EQ(operation, task->getEvents().back().substr(0, operation.size()));
        EXPECT_EQ(nullptr, owned);
    }
}

TEST_F(NetworkCancelTest, MaySubmitTheNextTaskInsideEveryCallback) {
    for (const std::string operation : {"ready?", "issue", "response", "bytes", "finished"}) {
        server.setDefaultAnswer(Answer::status(200, {}, "body"));
        const auto first = makeTask(server.getUrl());
        const auto second = makeTask(server.getUrl());
        first->setHook(operation, [this, second] { holder.submitNoRetries(second); });
        holder.submitNoRetries(first);
        EXPECT_EQ("finished 200", second->waitForEnd()) << operation;
        EXPECT_EQ(operation, first->getEvents().back().substr(0, operation.size()));
    }
}

TEST_F(NetworkCancelTest, LetsTheOwnerReleaseTheTaskAtItsEndAndGoOn) {
    const auto first = makeTask(server.getUrl());
    const auto second = makeTask(server.getUrl());
    bool workingAtTheEnd = false;
    bool workingAfterRelease = true;
    first->setHook("finished", [&] {
        workingAtTheEnd = holder.isWorking();
        holder.onFinished();
        workingAfterRelease = holder.isWorking();
        holder.submitNoRetries(second);
    });
    holder.submitNoRetries(first);
    EXPECT_EQ("finished 200", second->waitForEnd());
    EXPECT_TRUE(workingAtTheEnd);
    EXPECT_FALSE(workingAfterRelease);
    EXPECT_EQ("finished 200", first->waitForEnd());
}

TEST_F(NetworkCancelTest, GivesARunningTaskUpForTheNextOne) {
    server.script({Answer::never()});
    const auto first = makeTask(server.getUrl());
    const auto second = makeTask(server.getUrl());
    holder.submitNoRetries(first);
    ASSERT_TRUE(server.waitForRequest(1));
    holder.submitNoRetries(second);
    EXPECT_EQ("finished 200", second->waitForEnd());
    EXPECT_THAT(first->getEvents(), ElementsAre("ready?", "issue"));
}

TEST_F(NetworkCancelTest, RefusesToRunNothing) {
    TestSupport::AssertCapture asserts;
    holder.submitNoRetries(nullptr);
    EXPECT_EQ(1U, asserts.count());
    EXPECT_FALSE(holder.isWorking());
}

TEST_F(NetworkCancelTest, AllowsACancelOfAStreamThatIsBeingWritten) {
    for (int i = 0; i < 100; ++i) {
        const auto writer = boost::make_shared<NetworkTaskWriter>();
        holder.submitNoRetries(makeStream(server.getUrl(), writer));
        std::thread source([&writer] {
            for (int n = 0; n < 100; ++n) {
                write(*writer, "some bytes");
            }
            writer->close();
        });
        if (i % 2 == 0) {
            ASSERT_TRUE(server.waitForHead(1));
        }
        holder.cancel();
        source.join();
    }
    EXPECT_FALSE(holder.isWorking());
}

TEST_F(NetworkCancelTest, KeepsItsPromiseAgainstARunningServer) {
    // Whatever arrives meanwhile: once the cancel has returned, nothing is called any more.
    std::mt19937 random(7);
    server.setDefaultAnswer(Answer::status(200, {}, "body"));
    for (int i = 0; i < 200; ++i) {
        const auto task = makeTask(server.getUrl());
        holder.submitNoRetries(task);
        const char* const waits[] = {nullptr, "issue", "response", "bytes", "finished"};
        const char* const wait = waits[random() % 5];
        if (wait != nullptr) {
            ASSERT_TRUE(task->waitFor(wait));
        }
        holder.cancel();
        const std::size_t events = task->getEvents().size();
        settle();
        EXPECT_EQ(0, kdDrainEventsKOR());
        EXPECT_EQ(events, task->getEvents().size());
    }
}

TEST_F(NetworkCancelTest, DoesNotWaitForANetworkThreadThatWaitsForTheLock) {
    const auto task = makeTask(server.getUrl());
    std::promise<void> inside;
    task->setHook("response", [&] { inside.set_value(); });
    const auto slow = makeTask(server.getUrl());
    server.script({Answer::status(200), Answer::status(200).held()});
    {
        NetworkTaskHolder other;
        holder.submitNoRetries(task);
        inside.get_future().wait();
        other.submitNoRetries(slow);
        ASSERT_TRUE(server.waitForRequest(2));
        const Util::EventLock lock;
        server.release();  // its callbacks now wait for the lock
        other.cancel();
    }
    settle();
    EXPECT_THAT(slow->getEvents(), ElementsAre("ready?", "issue"));
}

TEST_F(NetworkCancelTest, TearsTheManagerDownWhileAPeerIsSilent) {
    server.setDefaultAnswer(Answer::never());
    const auto task = makeTask(server.getUrl());
    holder.submit(task, retry(2000, 10));
    ASSERT_TRUE(server.waitForRequest(1));
    Util::SingletonStorage::destroyAll();
    EXPECT_TRUE(server.waitForClosed(1));
    EXPECT_EQ("finished -1", task->waitForEnd());
    // The next use makes a new one.
    server.setDefaultAnswer(Answer::status(200));
    const auto next = makeTask(server.getUrl());
    holder.submitNoRetries(next);
    EXPECT_EQ("finished 200", next->waitForEnd());
}

TEST_F(NetworkCancelTest, TearsTheManagerDownWhileCallbacksWaitForTheLock) {
    server.setDefaultAnswer(Answer::status(200, {}, "body").held());
    const auto task = makeTask(server.getUrl());
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForRequest(1));
    {
        const Util::EventLock lock;
        const Util::EventLock again;
        server.release();
        Util::SingletonStorage::destroyAll();
        EXPECT_EQ(1, kdHoldsEventLockKOR());
    }
    EXPECT_EQ(0, kdHoldsEventLockKOR());
    EXPECT_NE("", task->waitForEnd());
}

TEST_F(NetworkCancelTest, EndsAStreamAtTheTearDownAndKeepsItsWriterUsable) {
    const auto writer = boost::make_shared<NetworkTaskWriter>();
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    write(*writer, "x");
    ASSERT_TRUE(server.waitForBody(0, 1));
    Util::SingletonStorage::destroyAll();
    write(*writer, "y");
    writer->close();
    EXPECT_EQ("finished -1", task->waitForEnd());
}

TEST_F(NetworkCancelTest, OutlivesTheManagerWithAPauseBeforeARetry) {
    server.script({Answer::status(500)});
    const auto task = makeTask(server.getUrl());
    holder.submit(task, retry(2000, 2));
    ASSERT_TRUE(task->waitFor("response 500"));
    settle();
    Util::SingletonStorage::destroyAll();
    advanceMs(2000);
    EXPECT_EQ("finished -1", task->waitForEnd());
}

}  // namespace
