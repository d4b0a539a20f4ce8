#include <gmock/gmock.h>

#include <limits>
#include <thread>

#include "Ticker.h"
#include "pal/kd_time.h"
#include "support/LogCapture.h"

using PalTest::Ticker;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

namespace {

class ManualClock : public ::testing::Test {
  protected:
    void SetUp() override { kdUseManualClockKOR(1000); }
    void TearDown() override { kdUseRealClockKOR(); }
};

TEST_F(ManualClock, StandsStillUntilMoved) {
    EXPECT_EQ(kdGetTimeUST(), 1000);
    EXPECT_EQ(kdGetTimeUST(), 1000);
    kdAdvanceClockKOR(5);
    EXPECT_EQ(kdGetTimeUST(), 1005);
    kdAdvanceClockKOR(0);
    kdAdvanceClockKOR(-7);
    EXPECT_EQ(kdGetTimeUST(), 1005);
}

TEST_F(ManualClock, StopsAtTheLargestTime) {
    kdAdvanceClockKOR(std::numeric_limits<KDint64>::max());
    EXPECT_EQ(kdGetTimeUST(), std::numeric_limits<KDint64>::max());
}

TEST_F(ManualClock, CountsCalendarTimeFromItsStart) {
    kdUseManualClockKOR(1600000000LL * 1000000000 + 999999999);
    KDtime stored = 0;
    EXPECT_EQ(kdTime(&stored), 1600000000);
    EXPECT_EQ(stored, 1600000000);
    kdAdvanceClockKOR(1);
    EXPECT_EQ(kdTime(nullptr), 1600000001);
    kdUseManualClockKOR(-1);
    EXPECT_EQ(kdTime(nullptr), -1);
}

TEST_F(ManualClock, FiresAOneShotOnceAtItsDueTime) {
    KDust shown = 0;
    Ticker ticker([&shown](const KDEvent&) { shown = kdGetTimeUST(); });
    ticker.start(50);
    kdAdvanceClockKOR(49);
    EXPECT_THAT(ticker.due, IsEmpty());
    kdAdvanceClockKOR(1000);
    EXPECT_THAT(ticker.due, ElementsAre(1050));
    EXPECT_EQ(shown, 1050);
    EXPECT_EQ(kdGetTimeUST(), 2049);
    kdAdvanceClockKOR(1000);
    EXPECT_EQ(ticker.count(), 1u);
}

TEST_F(ManualClock, TellsTheCallbackAboutItsTimer) {
    KDEvent seen{};
    Ticker ticker([&seen](const KDEvent& event) { seen = event; });
    ticker.start(1);
    kdAdvanceClockKOR(1);
    EXPECT_EQ(seen.type, KD_EVENT_TIMER);
    EXPECT_EQ(seen.userptr, &ticker);
    EXPECT_EQ(seen.timer, ticker.timer());
    EXPECT_NE(seen.timer, nullptr);
}

TEST_F(ManualClock, FiresOnTheMovingThreadUnderTheEventLock) {
    std::thread::id thread;
    KDint held = 0;
    Ticker ticker([&](const KDEvent&) {
        thread = std::this_thread::get_id();
        held = kdHoldsEventLockKOR();
    });
    ticker.start(1);
    kdAdvanceClockKOR(1);
    EXPECT_EQ(thread, std::this_thread::get_id());
    EXPECT_EQ(held, 1);
    EXPECT_EQ(kdHoldsEventLockKOR(), 0);
}

TEST_F(ManualClock, FiresInTheOrderOfDueTimesThenOfStart) {
    std::string order;
    Ticker late([&order](const KDEvent&) { order += 'l'; });
    Ticker first([&order](const KDEvent&) { order += '1'; });
    Ticker second([&order](const KDEvent&) { order += '2'; });
    Ticker early([&order](const KDEvent&) { order += 'e'; });
    late.start(30);
    first.start(20);
    second.start(20);
    early.start(10);
    kdAdvanceClockKOR(100);
    EXPECT_EQ(order, "e12l");
}

TEST_F(ManualClock, KeepsThePeriodOfBothPeriodicTypes) {
    Ticker average;
    Ticker minimum;
    average.start(100, KD_TIMER_PERIODIC_AVERAGE);
    minimum.start(150, KD_TIMER_PERIODIC_MINIMUM);
    kdAdvanceClockKOR(350);
    EXPECT_THAT(average.due, ElementsAre(1100, 1200, 1300));
    EXPECT_THAT(minimum.due, ElementsAre(1150, 1300));
}

TEST_F(ManualClock, FiresWhatACallbackStartsWhenItIsDueBeforeTheEnd) {
    Ticker second;
    Ticker tooLate;
    Ticker first([&](const KDEvent&) {
        second.start(10);
        tooLate.start(11);
    });
    first.start(20);
    kdAdvanceClockKOR(30);
    EXPECT_THAT(second.due, ElementsAre(1030));
    EXPECT_THAT(tooLate.due, IsEmpty());
}

TEST_F(ManualClock, MayBeMovedFromInsideACallback) {
    Ticker between;
    Ticker after;
    Ticker outer([&](const KDEvent&) {
        kdAdvanceClockKOR(30);
        EXPECT_EQ(kdGetTimeUST(), 1050);
        EXPECT_THAT(between.due, ElementsAre(1040));
    });
    outer.start(20);
    between.start(40);
    after.start(60);
    kdAdvanceClockKOR(100);
    EXPECT_THAT(after.due, ElementsAre(1060));
    EXPECT_EQ(kdGetTimeUST(), 1100);
}

TEST_F(ManualClock, DoesNotGoBackWhenACallbackMovesItFurther) {
    Ticker outer([](const KDEvent&) { kdAdvanceClockKOR(500); });
    outer.start(20);
    kdAdvanceClockKOR(100);
    EXPECT_EQ(kdGetTimeUST(), 1520);
}

TEST_F(ManualClock, StopsMovingWhenACallbackChoosesTheRealClock) {
    Ticker never;
    Ticker ticker([](const KDEvent&) { kdUseRealClockKOR(); });
    ticker.start(20);
    never.start(3600LL * 1000000000);
    kdAdvanceClockKOR(7200LL * 1000000000);
    EXPECT_THAT(never.due, IsEmpty());
    kdUseManualClockKOR(0);
    EXPECT_EQ(kdGetTimeUST(), 0);
}

TEST_F(ManualClock, SilencesATimerThatAnotherCallbackCancels) {
    Ticker victim;
    Ticker killer([&victim](const KDEvent&) { EXPECT_EQ(victim.cancel(), 0); });
    killer.start(20);
    victim.start(20);
    kdAdvanceClockKOR(100);
    EXPECT_EQ(killer.count(), 1u);
    EXPECT_EQ(victim.count(), 0u);
}

TEST_F(ManualClock, LetsAPeriodicTimerCancelItself) {
    Ticker* self = nullptr;
    Ticker ticker([&self](const KDEvent&) {
        if (self->count() == 2) {
            EXPECT_EQ(self->cancel(), 0);
        }
    });
    self = &ticker;
    ticker.start(10, KD_TIMER_PERIODIC_AVERAGE);
    kdAdvanceClockKOR(100);
    EXPECT_THAT(ticker.due, ElementsAre(1010, 1020));
}

TEST_F(ManualClock, RestartsATimerFromItsOwnCallback) {
    Ticker* self = nullptr;
    Ticker ticker([&self](const KDEvent&) {
        if (self->count() < 3) {
            self->start(7);
        }
    });
    self = &ticker;
    ticker.start(10);
    kdAdvanceClockKOR(100);
    EXPECT_THAT(ticker.due, ElementsAre(1010, 1017, 1024));
}

TEST_F(ManualClock, GoesOnWhenACallbackThrows) {
    const TestSupport::LogCapture log;
    Ticker thrower([](const KDEvent&) { throw 1; });
    Ticker later;
    thrower.start(10);
    later.start(20);
    kdAdvanceClockKOR(100);
    EXPECT_EQ(kdHoldsEventLockKOR(), 0);
    EXPECT_EQ(kdGetTimeUST(), 1100);
    EXPECT_THAT(later.due, ElementsAre(1020));
    EXPECT_THAT(log.messages(),
                ElementsAre("PAL: an exception ended a callback: of an unknown type"));
}

TEST_F(ManualClock, KeepsTheTimeThatWasLeftWhenItIsSetAnew) {
    Ticker ticker;
    ticker.start(100);
    kdAdvanceClockKOR(40);
    kdUseManualClockKOR(5000);
    kdAdvanceClockKOR(59);
    EXPECT_THAT(ticker.due, IsEmpty());
    kdAdvanceClockKOR(1);
    EXPECT_THAT(ticker.due, ElementsAre(5060));
}

TEST_F(ManualClock, FreezesTheTimersOfTheRealClock) {
    kdUseRealClockKOR();
    Ticker ticker;
    ticker.start(3600LL * 1000000000);
    kdUseManualClockKOR(0);
    kdAdvanceClockKOR(3590LL * 1000000000);
    EXPECT_THAT(ticker.due, IsEmpty());
    kdAdvanceClockKOR(11LL * 1000000000);
    EXPECT_EQ(ticker.count(), 1u);
}

TEST_F(ManualClock, CountsIntervalsBelowOneAsOne) {
    Ticker zero;
    Ticker negative;
    zero.start(0);
    negative.start(std::numeric_limits<KDint64>::min());
    EXPECT_THAT(zero.due, IsEmpty());
    kdAdvanceClockKOR(1);
    EXPECT_THAT(zero.due, ElementsAre(1001));
    EXPECT_THAT(negative.due, ElementsAre(1001));
}

TEST_F(ManualClock, NeverReachesATimerBeyondTheLargestTime) {
    Ticker ticker;
    ticker.start(std::numeric_limits<KDint64>::max(), KD_TIMER_PERIODIC_AVERAGE);
    kdAdvanceClockKOR(1000000);
    EXPECT_THAT(ticker.due, IsEmpty());
}

}  // namespace
