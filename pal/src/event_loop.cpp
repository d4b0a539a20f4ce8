// The event thread does four things in turn: it runs what was posted, delivers the ends of
// background work, fires timers, and sleeps. Each of them takes one batch, so that none can starve
// the others, and each callback runs under the event lock of its own, so that other threads come in
// between.
//
// A caller that gives the thread something to do sets `awake` under the mutex and signals. `sleep`
// looks at `awake` under the same mutex, so no wake-up is lost. The signal is a condition
// variable's and not a descriptor's: the engine has to work in processes that have run out of
// those.
//
// The threads start with the first use and are never stopped before the process ends. A start that
// fails leaves nothing behind. At the end of the process `stop` waits, for a bounded time and
// without the event lock, for the callback that runs. If that one does not return, the thread is
// left behind, and `isBlocked` tells the owners of singletons to leave everything that it may still
// use alone.
#include "event_loop.h"

#include <pthread.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <exception>

#include "event_lock.h"
#include "pal/CallGuarded.h"
#include "pal/SignalsBlocked.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"
#include "timer_table.h"
#include "work_queue.h"

namespace korvel_pal {

namespace {

constexpr std::chrono::seconds STOP_LIMIT{2};

// Room for what a session has in flight at a time, so that posting takes no memory.
constexpr std::size_t POSTS_RESERVED = 64;

void stopAtExit() {
    EventLoop::instance().stop();
}

}  // namespace

EventLoop& EventLoop::instance() {
    static Immortal<EventLoop> eventLoop;
    return eventLoop.get();
}

bool EventLoop::start() {
    const std::lock_guard<std::mutex> lock(mutex);
    return isStopping() || startThreads();
}

bool EventLoop::post(void (*func)(void*), void* user) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (!isStopping() && !startThreads()) {
        return false;
    }
    try {
        // When the process ends: never run, but kept, so that nothing counts as lost.
        pending.push_back({func, user});
    } catch (const std::exception&) {
        kdLogMessage("PAL: no memory for an event");
        return false;
    }
    if (!isStopping()) {
        ++postedCount;
        awake = true;
        wakeSignal.notifyOne();
    }
    return true;
}

void EventLoop::wake() {
    const std::lock_guard<std::mutex> lock(mutex);
    if (!isStopping() && startThreads()) {
        awake = true;
        wakeSignal.notifyOne();
    }
}

bool EventLoop::drain() {
    std::unique_lock<std::mutex> lock(mutex);
    const std::uint64_t wanted = postedCount;
    changed.wait(lock, [this, wanted] { return handledCount >= wanted || isStopping(); });
    return !isStopping();
}

void EventLoop::stop() {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        if (stopping.exchange(true)) {
            return;
        }
        awake = true;
        wakeSignal.notifyOne();
        changed.notify_all();
    }
    WorkQueue::instance().end();
    if (thread.get_id() == std::this_thread::get_id()) {
        return;  // a callback ends the process
    }
    // A thread that ends the process with the lock held must not make the event thread wait for it.
    EventLockRelease release;
    if (!waitForCallbacks()) {
        blocked = true;
        release.keepReleased();
    }
}

bool EventLoop::waitForCallbacks() {
    const auto limit = std::chrono::steady_clock::now() + STOP_LIMIT;
    std::unique_lock<std::mutex> lock(mutex);
    const bool ended = changed.wait_until(lock, limit, [this] { return finished || !started; });
    lock.unlock();
    if (!ended) {
        thread.detach();
        kdLogMessage("PAL: the event thread is blocked and was left behind");
        return false;
    }
    if (thread.joinable()) {
        thread.join();
    }
    // Other threads deliver as well, under the lock and only while deliveries have not ended.
    return waitForEventLock(limit);
}

bool EventLoop::startThreads() {
    if (started) {
        return true;
    }
    const SignalsBlocked signalsBlocked;
    WorkQueue& workQueue = WorkQueue::instance();
    if (!workQueue.startFirstWorker()) {
        return false;
    }
    try {
        pending.reserve(POSTS_RESERVED);
        current.reserve(POSTS_RESERVED);
        thread = std::thread(&EventLoop::run, this);
    } catch (const std::exception& exception) {
        kdLogFormatMessage("PAL: the event thread cannot start: %s", exception.what());
        workQueue.endWorkers();
        return false;
    }
    started = true;
    std::atexit(&stopAtExit);
    return true;
}

void EventLoop::run() {
#if defined(__linux__)
    // Else it would bear the name of whichever thread was the first to post.
    pthread_setname_np(pthread_self(), "talvox-events");
#endif
    while (!isStopping()) {
        runPosts();
        WorkQueue::instance().deliverCompleted();
        TimerTable::instance().fireDue();
        sleep();
    }
    const std::lock_guard<std::mutex> lock(mutex);
    finished = true;
    changed.notify_all();
}

void EventLoop::sleep() {
    const std::int64_t waitNs = TimerTable::instance().timeToNext();
    std::unique_lock<std::mutex> lock(mutex);
    if (!awake && waitNs == TimerTable::NEVER) {
        wakeSignal.wait(lock);
    } else if (!awake && waitNs > 0) {
        wakeSignal.waitFor(lock, waitNs);
    }
    awake = false;
}

// One swap for each turn, so that posts which post again cannot starve the timers.
void EventLoop::runPosts() {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        current.swap(pending);
    }
    for (const Post& post : current) {
        const EventLockGuard lock;
        if (isStopping()) {
            return;
        }
        callGuarded([&post] { post.func(post.user); });
    }
    const std::lock_guard<std::mutex> lock(mutex);
    handledCount += current.size();
    current.clear();
    changed.notify_all();
}

}  // namespace korvel_pal

KDint kdStartEventsKOR(void) {
    return korvel_pal::EventLoop::instance().start() ? 0 : -1;
}

KDint kdPostKOR(void (*func)(void* user), void* user) {
    return KOR_ASSERT(func) && korvel_pal::EventLoop::instance().post(func, user) ? 0 : -1;
}

KDint kdDrainEventsKOR(void) {
    if (kdHoldsEventLockKOR() != 0) {
        return -1;
    }
    if (!korvel_pal::EventLoop::instance().drain()) {
        return -1;
    }
    // A timer's callback or a completion may be under way.
    const korvel_pal::EventLockGuard lock;
    return 0;
}

void kdEndEventsFirstKOR(void) {
    std::atexit(&korvel_pal::stopAtExit);
}

KDint kdEventsHaveEndedKOR(void) {
    const korvel_pal::EventLoop& loop = korvel_pal::EventLoop::instance();
    if (!loop.isStopping()) {
        return 0;
    }
    return loop.isBlocked() ? -1 : 1;
}
