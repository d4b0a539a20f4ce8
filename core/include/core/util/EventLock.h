/**
 * @file
 * Scope guard of the event lock.
 */
#pragma once

#include "pal/kd_event.h"

namespace Util {

/**
 * Holds the event lock (see pal/kd_event.h) for its own lifetime. Recursive; may wait for a
 * callback that is being delivered on the event thread, never for a device or the network.
 */
class EventLock {
  public:
    EventLock() { kdEventLockKOR(); }
    ~EventLock() { kdEventUnlockKOR(); }
    EventLock(const EventLock&) = delete;
    EventLock& operator=(const EventLock&) = delete;
};

}  // namespace Util
