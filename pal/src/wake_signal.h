#pragma once

#include <pthread.h>

#include <cstdint>
#include <mutex>

namespace korvel_pal {

/**
 * A condition variable on the system's monotonic clock. The standard one waits on the calendar
 * clock where the C library is old, as on Android before 11, and a step of that clock would then
 * delay every timer.
 */
class WakeSignal {
  public:
    WakeSignal();
    ~WakeSignal() { pthread_cond_destroy(&condition); }
    WakeSignal(const WakeSignal&) = delete;
    WakeSignal& operator=(const WakeSignal&) = delete;

    void notifyOne() { pthread_cond_signal(&condition); }
    void notifyAll() { pthread_cond_broadcast(&condition); }

    /** Wake-ups may be spurious. The lock is held by the caller, before and after. */
    void wait(std::unique_lock<std::mutex>& lock);

    /** Returns after `nanoseconds` at the latest; else as `wait`. */
    void waitFor(std::unique_lock<std::mutex>& lock, std::int64_t nanoseconds);

  private:
    pthread_cond_t condition;
};

}  // namespace korvel_pal
