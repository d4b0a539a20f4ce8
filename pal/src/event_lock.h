#pragma once

#include <chrono>

#include "pal/kd_event.h"

namespace korvel_pal {

class EventLockGuard {
  public:
    EventLockGuard() { kdEventLockKOR(); }
    ~EventLockGuard() { kdEventUnlockKOR(); }
    EventLockGuard(const EventLockGuard&) = delete;
    EventLockGuard& operator=(const EventLockGuard&) = delete;
};

/** Waits until the event lock is free once, not beyond `limit`. @return whether it was */
bool waitForEventLock(std::chrono::steady_clock::time_point limit);

/** Gives up all levels of the event lock that the calling thread holds, for its own lifetime. */
class EventLockRelease {
  public:
    EventLockRelease();
    ~EventLockRelease();
    EventLockRelease(const EventLockRelease&) = delete;
    EventLockRelease& operator=(const EventLockRelease&) = delete;

    /** Leaves the lock given up for good. */
    void keepReleased() { levels = 0; }

  private:
    int levels;
};

}  // namespace korvel_pal
