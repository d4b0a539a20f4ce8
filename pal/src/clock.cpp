#include "clock.h"

#include <atomic>
#include <chrono>

#include "pal/kd_time.h"
#include "timer_table.h"

namespace korvel_pal {

namespace {

std::atomic<bool> manual{false};
std::atomic<std::int64_t> manualNow{0};

template <typename SystemClock>
std::int64_t nanoseconds() {
    const auto sinceStart = SystemClock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::nanoseconds>(sinceStart).count();
}

std::int64_t wholeSeconds(std::int64_t time) {
    return time / NS_PER_SECOND - (time % NS_PER_SECOND < 0 ? 1 : 0);
}

}  // namespace

std::int64_t Clock::now() {
    return isManual() ? manualNow.load() : nanoseconds<std::chrono::steady_clock>();
}

bool Clock::isManual() {
    return manual.load();
}

void Clock::useManual(std::int64_t now) {
    manualNow.store(now);
    manual.store(true);
}

void Clock::useReal() {
    manual.store(false);
}

}  // namespace korvel_pal

KDust kdGetTimeUST(void) {
    return korvel_pal::Clock::now();
}

KDtime kdTime(KDtime* timep) {
    using namespace korvel_pal;
    const std::int64_t now =
        Clock::isManual() ? Clock::now() : nanoseconds<std::chrono::system_clock>();
    const KDtime seconds = wholeSeconds(now);
    if (timep != nullptr) {
        *timep = seconds;
    }
    return seconds;
}

void kdUseManualClockKOR(KDust startUST) {
    korvel_pal::TimerTable::instance().useManualClock(startUST);
}

void kdUseRealClockKOR(void) {
    korvel_pal::TimerTable::instance().useRealClock();
}

void kdAdvanceClockKOR(KDint64 nanoseconds) {
    korvel_pal::TimerTable::instance().advanceManualClock(nanoseconds);
}
