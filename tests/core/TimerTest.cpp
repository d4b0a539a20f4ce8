#include "core/util/Timer.h"

#include <gmock/gmock.h>

#include <future>
#include <memory>
#include <thread>

#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "support/AssertCapture.h"

namespace {

constexpr int64_t SECOND = 1000000000;

class Timer : public ::testing::Test {
  protected:
    void SetUp() override { kdUseManualClockKOR(0); }
    void TearDown() override { kdUseRealClockKOR(); }

    int calls = 0;
    Util::Timer timer{[this] { ++calls; }};
};

TEST_F(Timer, FiresOnceAtItsDueTime) {
    timer.start(KD_TIMER_ONESHOT, 20 * SECOND);
    kdAdvanceClockKOR(20 * SECOND - 1);
    EXPECT_EQ(calls, 0);
    EXPECT_TRUE(timer.isRunning());
    kdAdvanceClockKOR(1);
    EXPECT_EQ(calls, 1);
    EXPECT_FALSE(timer.isRunning());
    kdAdvanceClockKOR(100 * SECOND);
    EXPECT_EQ(calls, 1);
}

TEST_F(Timer, FiresPeriodicallyUntilCancelled) {
    timer.start(KD_TIMER_PERIODIC_AVERAGE, SECOND);
    kdAdvanceClockKOR(3 * SECOND);
    EXPECT_EQ(calls, 3);
    EXPECT_TRUE(timer.isRunning());
    timer.cancel();
    EXPECT_FALSE(timer.isRunning());
    kdAdvanceClockKOR(3 * SECOND);
    EXPECT_EQ(calls, 3);
}

TEST_F(Timer, DoesNotRunAtFirstAndMayBeCancelledAtAnyTime) {
    EXPECT_FALSE(timer.isRunning());
    timer.cancel();
    timer.start(KD_TIMER_ONESHOT, SECOND);
    timer.cancel();
    timer.cancel();
    kdAdvanceClockKOR(2 * SECOND);
    EXPECT_EQ(calls, 0);
}

TEST_F(Timer, StartedAgainCountsAnew) {
    timer.start(KD_TIMER_PERIODIC_AVERAGE, SECOND);
    timer.start(KD_TIMER_ONESHOT, 5 * SECOND);
    kdAdvanceClockKOR(4 * SECOND);
    EXPECT_EQ(calls, 0);
    kdAdvanceClockKOR(SECOND);
    EXPECT_EQ(calls, 1);
}

TEST_F(Timer, IsOverForItsOwnOneShotCall) {
    bool running = true;
    Util::Timer* self = nullptr;
    Util::Timer asking([&] { running = self->isRunning(); });
    self = &asking;
    asking.start(KD_TIMER_ONESHOT, 1);
    kdAdvanceClockKOR(1);
    EXPECT_FALSE(running);
}

TEST_F(Timer, MayBeRestartedByItsFunction) {
    int count = 0;
    Util::Timer* self = nullptr;
    Util::Timer restarting([&] {
        if (++count < 3) {
            self->start(KD_TIMER_ONESHOT, SECOND);
        }
    });
    self = &restarting;
    restarting.start(KD_TIMER_ONESHOT, SECOND);
    kdAdvanceClockKOR(10 * SECOND);
    EXPECT_EQ(count, 3);
}

TEST_F(Timer, MayBeDestroyedByItsFunction) {
    const auto token = std::make_shared<int>(0);
    std::unique_ptr<Util::Timer> owned;
    owned = std::make_unique<Util::Timer>([&owned, token] {
        owned.reset();
        ++*token;  // the captured values outlive the timer until the function has returned
    });
    owned->start(KD_TIMER_PERIODIC_AVERAGE, SECOND);
    kdAdvanceClockKOR(5 * SECOND);
    EXPECT_EQ(*token, 1);
    EXPECT_EQ(token.use_count(), 1);
}

TEST_F(Timer, DestroyedWhileRunningIsSilent) {
    int count = 0;
    {
        Util::Timer shortLived([&count] { ++count; });
        shortLived.start(KD_TIMER_PERIODIC_AVERAGE, SECOND);
    }
    kdAdvanceClockKOR(5 * SECOND);
    EXPECT_EQ(count, 0);
}

TEST_F(Timer, RunsItsFunctionUnderTheEventLock) {
    KDint held = 0;
    Util::Timer asking([&held] { held = kdHoldsEventLockKOR(); });
    asking.start(KD_TIMER_ONESHOT, 1);
    kdAdvanceClockKOR(1);
    EXPECT_EQ(held, 1);
}

TEST_F(Timer, AssertsOnBadArguments) {
    const TestSupport::AssertCapture asserts;
    Util::Timer empty{std::function<void()>()};
    EXPECT_EQ(asserts.count(), 1u);
    empty.start(KD_TIMER_ONESHOT, 1);
    EXPECT_EQ(asserts.count(), 2u);
    EXPECT_FALSE(empty.isRunning());
    timer.start(7, 1);
    EXPECT_EQ(asserts.count(), 3u);
    EXPECT_FALSE(timer.isRunning());
    kdAdvanceClockKOR(10);
    EXPECT_EQ(calls, 0);
}

TEST(TimerOnTheRealClock, FiresOnTheEventThread) {
    std::promise<std::thread::id> fired;
    Util::Timer timer([&fired] { fired.set_value(std::this_thread::get_id()); });
    timer.start(KD_TIMER_ONESHOT, 1);
    EXPECT_NE(fired.get_future().get(), std::this_thread::get_id());
}

TEST(TimerOnTheRealClock, CancelledFromAnyThreadIsSilent) {
    for (int round = 0; round < 200; ++round) {
        bool cancelled = false;  // under the event lock
        bool calledLater = false;
        Util::Timer timer([&] { calledLater = cancelled; });
        timer.start(KD_TIMER_PERIODIC_AVERAGE, 1000);
        {
            const Util::EventLock lock;
            timer.cancel();
            cancelled = true;
        }
        EXPECT_EQ(kdDrainEventsKOR(), 0);
        const Util::EventLock lock;
        EXPECT_FALSE(calledLater);
    }
}

}  // namespace
