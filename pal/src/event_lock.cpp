#include "event_lock.h"

#include <mutex>
#include <thread>

#include "immortal.h"
#include "pal/kd_assert.h"

namespace {

thread_local int levelsHeld = 0;

std::mutex& eventMutex() {
    static korvel_pal::Immortal<std::mutex> mutex;
    return mutex.get();
}

}  // namespace

void kdEventLockKOR(void) {
    if (levelsHeld == 0) {
        eventMutex().lock();
    }
    ++levelsHeld;
}

void kdEventUnlockKOR(void) {
    if (!KOR_ASSERT(levelsHeld > 0)) {
        return;
    }
    if (--levelsHeld == 0) {
        eventMutex().unlock();
    }
}

KDint kdHoldsEventLockKOR(void) {
    return levelsHeld > 0 ? 1 : 0;
}

namespace korvel_pal {

// Not a timed mutex: this happens once, and ThreadSanitizer knows the plain one best.
bool waitForEventLock(std::chrono::steady_clock::time_point limit) {
    while (!eventMutex().try_lock()) {
        if (std::chrono::steady_clock::now() >= limit) {
            return false;
        }
        std::this_thread::yield();
    }
    eventMutex().unlock();
    return true;
}

EventLockRelease::EventLockRelease() : levels(levelsHeld) {
    if (levels > 0) {
        levelsHeld = 0;
        eventMutex().unlock();
    }
}

EventLockRelease::~EventLockRelease() {
    if (levels > 0) {
        eventMutex().lock();
        levelsHeld = levels;
    }
}

}  // namespace korvel_pal
