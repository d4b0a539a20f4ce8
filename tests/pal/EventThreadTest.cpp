#include <gmock/gmock.h>
#include <pthread.h>

#include <functional>
#include <future>
#include <string>
#include <thread>
#include <vector>

#include "Ticker.h"
#include "pal/kd_event.h"
#include "support/AssertCapture.h"

namespace {

void post(std::function<void()> function) {
    kdPostKOR(
        [](void* user) {
            auto* const call = static_cast<std::function<void()>*>(user);
            (*call)();
            delete call;
        },
        new std::function<void()>(std::move(function)));
}

TEST(EventThread, BearsItsOwnName) {
    std::string name(16, '\0');
    post([&] { pthread_getname_np(pthread_self(), name.data(), name.size()); });
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    EXPECT_STREQ(name.c_str(), "talvox-events");
}

TEST(EventThread, RunsPostsInOrderOnOneThreadUnderTheLock) {
    std::vector<int> order;
    std::vector<std::thread::id> threads;
    KDint held = 1;
    for (int i = 0; i < 100; ++i) {
        post([&, i] {
            order.push_back(i);
            threads.push_back(std::this_thread::get_id());
            held &= kdHoldsEventLockKOR();
        });
    }
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    ASSERT_EQ(order.size(), 100u);
    for (int i = 0; i < 100; ++i) {
        EXPECT_EQ(order[i], i);
        EXPECT_EQ(threads[i], threads[0]);
    }
    EXPECT_NE(threads[0], std::this_thread::get_id());
    EXPECT_EQ(held, 1);
}

TEST(EventThread, RunsEveryPostOfManyThreads) {
    int count = 0;  // under the event lock
    std::vector<std::thread> threads;
    threads.reserve(4);
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&count] {
            for (int j = 0; j < 500; ++j) {
                post([&count] { ++count; });
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    EXPECT_EQ(count, 2000);
}

TEST(EventThread, RunsPostsThatArePostedByAPost) {
    std::promise<void> inner;
    post([&inner] { post([&inner] { inner.set_value(); }); });
    inner.get_future().get();
}

void postAgain(void* user) {
    if (!*static_cast<bool*>(user)) {
        kdPostKOR(&postAgain, user);
    }
}

TEST(EventThread, EndlessPostsDoNotStarveTimers) {
    bool stop = false;  // under the event lock
    std::promise<void> fired;
    PalTest::Ticker ticker([&](const KDEvent&) {
        stop = true;
        fired.set_value();
    });
    kdPostKOR(&postAgain, &stop);
    ticker.start(1000000);
    fired.get_future().get();
    EXPECT_EQ(kdDrainEventsKOR(), 0);
}

TEST(EventThread, PostingDoesNotWaitForTheLock) {
    bool ran = false;
    kdEventLockKOR();
    post([&ran] { ran = true; });
    EXPECT_FALSE(ran);
    kdEventUnlockKOR();
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    EXPECT_TRUE(ran);
}

TEST(EventThread, AssertsOnANullFunction) {
    const TestSupport::AssertCapture asserts;
    kdPostKOR(nullptr, nullptr);
    EXPECT_EQ(asserts.count(), 1u);
    EXPECT_EQ(asserts.reports().at(0).condition, "func");
}

TEST(Drain, IsRefusedWithTheLockHeld) {
    kdEventLockKOR();
    EXPECT_EQ(kdDrainEventsKOR(), -1);
    kdEventUnlockKOR();
    std::promise<KDint> result;
    post([&result] { result.set_value(kdDrainEventsKOR()); });
    EXPECT_EQ(result.get_future().get(), -1);
}

TEST(Drain, WaitsForACallbackThatIsUnderWay) {
    std::promise<void> begun;
    std::promise<void> draining;
    bool returned = false;
    PalTest::Ticker ticker([&](const KDEvent&) {
        begun.set_value();
        draining.get_future().get();
        returned = true;
    });
    ticker.start(1);
    begun.get_future().get();
    draining.set_value();
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    EXPECT_TRUE(returned);
}

TEST(EventLock, IsRecursiveAndKnowsItsHolder) {
    EXPECT_EQ(kdHoldsEventLockKOR(), 0);
    kdEventLockKOR();
    kdEventLockKOR();
    kdEventUnlockKOR();
    EXPECT_EQ(kdHoldsEventLockKOR(), 1);
    EXPECT_EQ(std::async(std::launch::async, [] { return kdHoldsEventLockKOR(); }).get(), 0);
    kdEventUnlockKOR();
    EXPECT_EQ(kdHoldsEventLockKOR(), 0);
}

TEST(EventLock, SerialisesThreads) {
    int count = 0;
    std::vector<std::thread> threads;
    threads.reserve(4);
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&count] {
            for (int j = 0; j < 1000; ++j) {
                kdEventLockKOR();
                ++count;
                kdEventUnlockKOR();
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(count, 4000);
}

TEST(EventLock, AssertsWhenReleasedOnceTooOften) {
    const TestSupport::AssertCapture asserts;
    kdEventUnlockKOR();
    EXPECT_EQ(asserts.count(), 1u);
    EXPECT_EQ(kdHoldsEventLockKOR(), 0);
    kdEventLockKOR();
    EXPECT_EQ(kdHoldsEventLockKOR(), 1);
    kdEventUnlockKOR();
}

}  // namespace
