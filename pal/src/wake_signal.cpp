#include "wake_signal.h"

#include <ctime>

#include "clock.h"

namespace korvel_pal {

WakeSignal::WakeSignal() : condition() {
    pthread_condattr_t attributes;
    pthread_condattr_init(&attributes);
    pthread_condattr_setclock(&attributes, CLOCK_MONOTONIC);
    pthread_cond_init(&condition, &attributes);
    pthread_condattr_destroy(&attributes);
}

void WakeSignal::wait(std::unique_lock<std::mutex>& lock) {
    pthread_cond_wait(&condition, lock.mutex()->native_handle());
}

void WakeSignal::waitFor(std::unique_lock<std::mutex>& lock, std::int64_t nanoseconds) {
    timespec end = {};
    clock_gettime(CLOCK_MONOTONIC, &end);
    const std::int64_t now = end.tv_sec * NS_PER_SECOND + end.tv_nsec;
    const std::int64_t due = addTime(now, nanoseconds);
    end.tv_sec = static_cast<time_t>(due / NS_PER_SECOND);
    end.tv_nsec = static_cast<long>(due % NS_PER_SECOND);
    pthread_cond_timedwait(&condition, lock.mutex()->native_handle(), &end);
}

}  // namespace korvel_pal
