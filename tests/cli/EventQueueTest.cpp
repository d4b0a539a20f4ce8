#include "cli/EventQueue.h"

#include <gtest/gtest.h>

#include <future>

#include "Events.h"

namespace {

using Cli::EventQueue;

TEST(EventQueue, HandsEventsOnInOrder) {
    EventQueue queue;
    queue.put(TestSupport::power(1, 10));
    queue.put(TestSupport::power(2, 20));
    EXPECT_EQ(queue.take()->ms, 1);
    EXPECT_EQ(queue.take()->ms, 2);
}

TEST(EventQueue, WaitsForAnEventOfAnotherThread) {
    EventQueue queue;
    std::future<int64_t> taken =
        std::async(std::launch::async, [&queue] { return queue.take()->ms; });
    queue.put(TestSupport::power(7, 10));
    EXPECT_EQ(taken.get(), 7);
}

TEST(EventQueue, AnInterruptGoesBeforeEventsAndCountsOnce) {
    EventQueue queue;
    queue.put(TestSupport::power(1, 10));
    queue.interrupt();
    EXPECT_FALSE(queue.take().has_value());
    EXPECT_TRUE(queue.take().has_value());
}

TEST(EventQueue, AnInterruptEndsAWait) {
    EventQueue queue;
    std::future<bool> taken =
        std::async(std::launch::async, [&queue] { return queue.take().has_value(); });
    queue.interrupt();
    EXPECT_FALSE(taken.get());
}

}  // namespace
