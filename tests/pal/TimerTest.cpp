#include <gmock/gmock.h>

#include <chrono>
#include <future>
#include <limits>
#include <thread>

#include "Ticker.h"
#include "pal/kd_event.h"
#include "pal/kd_time.h"

using PalTest::Ticker;

namespace {

constexpr KDint64 MS = 1000000;

int userptrOnly;

TEST(KdTimer, RefusesUnknownTypes) {
    EXPECT_EQ(kdSetTimer(1, 0, &userptrOnly), nullptr);
    EXPECT_EQ(kdSetTimer(1, 60, &userptrOnly), nullptr);
    EXPECT_EQ(kdSetTimer(1, 64, &userptrOnly), nullptr);
}

TEST(KdTimer, RefusesHandlesThatAreNotLive) {
    EXPECT_EQ(kdCancelTimer(nullptr), -1);
    EXPECT_EQ(kdCancelTimer(reinterpret_cast<KDTimer*>(&userptrOnly)), -1);
    KDTimer* const timer = kdSetTimer(3600000 * MS, KD_TIMER_ONESHOT, &userptrOnly);
    ASSERT_NE(timer, nullptr);
    EXPECT_EQ(kdCancelTimer(timer), 0);
    EXPECT_EQ(kdCancelTimer(timer), -1);
}

TEST(KdTimer, NeverGivesAHandleTwice) {
    KDTimer* const first = kdSetTimer(3600000 * MS, KD_TIMER_ONESHOT, &userptrOnly);
    EXPECT_EQ(kdCancelTimer(first), 0);
    KDTimer* const second = kdSetTimer(3600000 * MS, KD_TIMER_ONESHOT, &userptrOnly);
    EXPECT_EQ(kdCancelTimer(first), -1);
    EXPECT_EQ(kdCancelTimer(second), 0);
}

TEST(KdTimer, FiresOnTheRealClockAfterTimersThatWereCancelledOrAreLater) {
    std::promise<void> fired;
    const auto tell = [](const KDEvent* event) {
        static_cast<std::promise<void>*>(event->userptr)->set_value();
    };
    kdInstallCallback(tell, KD_EVENT_TIMER, &fired);
    KDTimer* const later = kdSetTimer(3600000 * MS, KD_TIMER_ONESHOT, &userptrOnly);
    KDTimer* const cancelled = kdSetTimer(1 * MS, KD_TIMER_ONESHOT, &userptrOnly);
    EXPECT_EQ(kdCancelTimer(cancelled), 0);
    KDTimer* const timer = kdSetTimer(2 * MS, KD_TIMER_ONESHOT, &fired);
    EXPECT_EQ(fired.get_future().wait_for(std::chrono::seconds(10)), std::future_status::ready);
    EXPECT_EQ(kdCancelTimer(timer), 0);
    EXPECT_EQ(kdCancelTimer(later), 0);
    kdInstallCallback(nullptr, KD_EVENT_TIMER, &fired);
}

TEST(KdTimer, KeepsTheHandleOfAOneShotThatHasFired) {
    kdUseManualClockKOR(0);
    Ticker ticker;
    ticker.start(10);
    kdAdvanceClockKOR(10);
    EXPECT_EQ(ticker.count(), 1u);
    EXPECT_EQ(ticker.cancel(), 0);
    kdUseRealClockKOR();
}

TEST(KdCallback, RefusesUnknownEventTypes) {
    EXPECT_EQ(kdInstallCallback([](const KDEvent*) {}, 41, &userptrOnly), -1);
    EXPECT_EQ(kdInstallCallback(nullptr, 0, &userptrOnly), -1);
}

int firstCalls;
int secondCalls;

TEST(KdCallback, ReplacesAndRemovesTheRegistrationOfAPair) {
    kdUseManualClockKOR(0);
    firstCalls = secondCalls = 0;
    KDTimer* const timer = kdSetTimer(10, KD_TIMER_PERIODIC_AVERAGE, &userptrOnly);
    kdAdvanceClockKOR(10);  // nobody has registered: dropped
    EXPECT_EQ(kdInstallCallback([](const KDEvent*) { ++firstCalls; }, 42, &userptrOnly), 0);
    kdAdvanceClockKOR(10);
    EXPECT_EQ(kdInstallCallback([](const KDEvent*) { ++secondCalls; }, 42, &userptrOnly), 0);
    kdAdvanceClockKOR(20);
    EXPECT_EQ(kdInstallCallback(nullptr, 42, &userptrOnly), 0);
    kdAdvanceClockKOR(20);
    EXPECT_EQ(firstCalls, 1);
    EXPECT_EQ(secondCalls, 2);
    EXPECT_EQ(kdCancelTimer(timer), 0);
    kdUseRealClockKOR();
}

TEST(KdTimer, FiresOnTheEventThreadUnderTheLockNotBeforeItsTime) {
    struct Seen {
        std::thread::id thread;
        KDint held;
        KDust lateBy;
    };
    std::promise<Seen> fired;
    Ticker ticker([&fired](const KDEvent& event) {
        fired.set_value(
            {std::this_thread::get_id(), kdHoldsEventLockKOR(), kdGetTimeUST() - event.timestamp});
    });
    const KDust before = kdGetTimeUST();
    ticker.start(3 * MS);
    const Seen seen = fired.get_future().get();
    EXPECT_NE(seen.thread, std::this_thread::get_id());
    EXPECT_EQ(seen.held, 1);
    EXPECT_GE(seen.lateBy, 0);
    EXPECT_GE(ticker.due.at(0) - before, 3 * MS);
}

TEST(KdTimer, FiresInOrderOnTheRealClock) {
    std::string order;
    std::promise<void> done;
    Ticker last([&done](const KDEvent&) { done.set_value(); });
    Ticker second([&order](const KDEvent&) { order += '2'; });
    Ticker first([&order](const KDEvent&) { order += '1'; });
    kdEventLockKOR();
    KDust begun = 0;
    // Each counts from its own start, so these must not be further apart than the times.
    do {
        begun = kdGetTimeUST();
        last.start(6 * MS);
        second.start(4 * MS);
        first.start(2 * MS);
    } while (kdGetTimeUST() - begun >= 2 * MS);
    kdEventUnlockKOR();
    done.get_future().get();
    EXPECT_EQ(order, "12");
}

// Holds up the event thread until a periodic timer is several periods late, then lets it run until
// it has ticked `ticks` times.
std::vector<KDust> lateTicks(KDint type, std::size_t ticks) {
    constexpr KDint64 PERIOD = 4 * MS;
    std::promise<void> enough;
    Ticker* self = nullptr;
    Ticker ticker([&](const KDEvent&) {
        if (self->count() == ticks) {
            self->cancel();
            enough.set_value();
        }
    });
    self = &ticker;
    kdEventLockKOR();
    ticker.start(PERIOD, type);
    const KDust start = kdGetTimeUST();
    while (kdGetTimeUST() - start < 4 * PERIOD) {
        std::this_thread::yield();
    }
    kdEventUnlockKOR();
    enough.get_future().get();
    return ticker.due;
}

TEST(KdTimer, CatchesUpWithAnAveragePeriod) {
    const std::vector<KDust> due = lateTicks(KD_TIMER_PERIODIC_AVERAGE, 5);
    for (std::size_t i = 1; i < due.size(); ++i) {
        EXPECT_EQ(due[i] - due[i - 1], 4 * MS);
    }
}

TEST(KdTimer, DoesNotCatchUpWithAMinimumPeriod) {
    const std::vector<KDust> due = lateTicks(KD_TIMER_PERIODIC_MINIMUM, 3);
    EXPECT_GE(due[1] - due[0], 16 * MS);
    EXPECT_GE(due[2] - due[1], 4 * MS);
}

TEST(KdTimer, ThatCannotKeepUpDoesNotShutOutPosts) {
    Ticker hopeless;
    hopeless.start(1, KD_TIMER_PERIODIC_AVERAGE);
    for (int i = 0; i < 3; ++i) {
        kdPostKOR([](void*) {}, nullptr);
        EXPECT_EQ(kdDrainEventsKOR(), 0);
    }
    kdEventLockKOR();
    EXPECT_GT(hopeless.count(), 0u);
    EXPECT_EQ(hopeless.cancel(), 0);
    kdEventUnlockKOR();
}

TEST(KdTimer, GoesOnWhenTheRealClockComesBack) {
    std::promise<void> fired;
    kdUseManualClockKOR(0);
    Ticker ticker([&fired](const KDEvent&) { fired.set_value(); });
    ticker.start(2 * MS);
    kdAdvanceClockKOR(MS);
    kdUseRealClockKOR();
    fired.get_future().get();
    EXPECT_EQ(ticker.count(), 1u);
}

TEST(KdTimer, IsSilentOnceCancelledUnderTheLock) {
    for (int round = 0; round < 50; ++round) {
        Ticker ticker;
        ticker.start(1000, KD_TIMER_PERIODIC_AVERAGE);
        kdEventLockKOR();
        ticker.cancel();
        const std::size_t before = ticker.count();
        kdEventUnlockKOR();
        EXPECT_EQ(kdDrainEventsKOR(), 0);
        EXPECT_EQ(ticker.count(), before);
    }
}

TEST(KdClock, RealTimeGoesForward) {
    const KDust first = kdGetTimeUST();
    const KDust second = kdGetTimeUST();
    EXPECT_LE(first, second);
    KDtime stored = 0;
    EXPECT_GT(kdTime(&stored), 1600000000);
    EXPECT_GT(stored, 1600000000);
}

TEST(KdClock, AdvancingDoesNothingOnTheRealClock) {
    Ticker ticker;
    ticker.start(3600000 * MS);
    const KDust before = kdGetTimeUST();
    kdAdvanceClockKOR(7200000 * MS);
    EXPECT_LT(kdGetTimeUST() - before, 3600000 * MS);
    EXPECT_EQ(ticker.count(), 0u);
}

}  // namespace
