#include "event_loop.h"

#include <pthread.h>

#include <chrono>
#include <cstdlib>

#include "event_lock.h"
#include "pal/SignalsBlocked.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"
#include "timer_table.h"
#include "work_queue.h"

namespace korvel_pal {

namespace {

constexpr std::chrono::seconds STOP_LIMIT{2};
constexpr std::int64_t NS_PER_MS = 1000000;

void stopAtExit() {
    EventLoop::instance().stop();
}

}  // namespace

EventLoop& EventLoop::instance() {
    static EventLoop* const eventLoop = new EventLoop;
    return *eventLoop;
}

void EventLoop::post(void (*func)(void*), void* user) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (isStopping()) {
        pending.push_back({func, user});  // never run; kept, so that nothing counts as lost
        return;
    }
    if (!start()) {
        return;
    }
    pending.push_back({func, user});
    ++postedCount;
    uv_async_send(&async);
}

void EventLoop::wake() {
    const std::lock_guard<std::mutex> lock(mutex);
    if (!isStopping() && start()) {
        uv_async_send(&async);
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
        if (started) {
            uv_async_send(&async);
        }
        changed.notify_all();
    }
    if (thread.get_id() == std::this_thread::get_id()) {
        return;  // a callback ends the process
    }
    // Whoever ends the process with the lock held must not make the event thread wait for it.
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

bool EventLoop::start() {
    if (started) {
        return true;
    }
    const SignalsBlocked signalsBlocked;
    if (!KOR_ASSERT(uv_loop_init(&loop) == 0)) {
        return false;
    }
    if (!KOR_ASSERT(uv_async_init(&loop, &async, &EventLoop::onWake) == 0)) {
        uv_loop_close(&loop);
        return false;
    }
    uv_timer_init(&loop, &timer);
    async.data = this;
    timer.data = this;
    thread = std::thread(&EventLoop::run, this);
    started = true;
    std::atexit(&stopAtExit);
    return true;
}

void EventLoop::run() {
#if defined(__linux__)
    // Else it would bear the name of whichever thread was the first to post.
    pthread_setname_np(pthread_self(), "talvox-events");
#endif
    uv_run(&loop, UV_RUN_DEFAULT);
    uv_loop_close(&loop);
    const std::lock_guard<std::mutex> lock(mutex);
    finished = true;
    changed.notify_all();
}

void EventLoop::onWake(uv_async_t* handle) {
    EventLoop& self = *static_cast<EventLoop*>(handle->data);
    self.runPosts();
    if (self.isStopping()) {
        self.closeHandles();
    } else {
        self.serveTimers();
    }
}

void EventLoop::onTimer(uv_timer_t* handle) {
    static_cast<EventLoop*>(handle->data)->serveTimers();
}

// One swap for each wake-up, so that posts which post again cannot starve the timers.
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
        post.func(post.user);
    }
    const std::lock_guard<std::mutex> lock(mutex);
    handledCount += current.size();
    current.clear();
    changed.notify_all();
}

void EventLoop::serveTimers() {
    TimerTable::instance().fireDue();
    const std::int64_t waitNs = TimerTable::instance().timeToNext();
    uv_timer_stop(&timer);
    if (waitNs == TimerTable::NEVER) {
        return;
    }
    if (waitNs == 0) {
        uv_async_send(&async);  // libuv would go on with its timers for ever
        return;
    }
    const std::int64_t waitMs = waitNs / NS_PER_MS + (waitNs % NS_PER_MS != 0 ? 1 : 0);
    uv_update_time(&loop);
    uv_timer_start(&timer, &EventLoop::onTimer, static_cast<std::uint64_t>(waitMs), 0);
}

void EventLoop::closeHandles() {
    WorkQueue::instance().cancelSubmitted();
    uv_close(reinterpret_cast<uv_handle_t*>(&timer), nullptr);
    uv_close(reinterpret_cast<uv_handle_t*>(&async), nullptr);
    // Work that runs is not waited for here; then the loop stays open for its last signal.
    uv_stop(&loop);
}

}  // namespace korvel_pal

void kdPostKOR(void (*func)(void* user), void* user) {
    if (KOR_ASSERT(func)) {
        korvel_pal::EventLoop::instance().post(func, user);
    }
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
