#pragma once

#include "pal/kd_event.h"

namespace korvel_pal {

class EventLockGuard {
  public:
    EventLockGuard() { kdEventLockKOR(); }
    ~EventLockGuard() { kdEventUnlockKOR(); }
    EventLockGuard(const EventLockGuard&) = delete;
    EventLockGuard& operator=(const EventLockGuard&) = delete;
};

/** Gives up all levels of the event lock that the calling thread holds, for its own lifetime. */
class EventLockRelease {
  public:
    EventLockRelease();
    ~EventLockRelease();
    EventLockRelease(const EventLockRelease&) = delete;
    EventLockRelease& operator=(const EventLockRelease&) = delete;

  private:
    int levels;
};

}  // namespace korvel_pal
