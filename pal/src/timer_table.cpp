// Timers live in two structures under one mutex: `timers` knows each by its handle, and `queue`
// holds those that wait, by due time and, where that is the same, in the order in which they were
// started.
//
// On the real clock the event loop sleeps until the first entry is due (`timeToNext`) and then
// fires what is due (`fireDue`). `loopWakesAt` is when it will wake by itself, so that `start`
// wakes it only for a timer that is due earlier. On the hand-driven clock nothing sleeps;
// `advanceManualClock` moves the clock from one due time to the next and calls on the thread that
// moves it.
//
// A callback runs under the event lock and outside the mutex, so it may start and cancel timers.
// The event lock is taken first and the due timer then: a timer that was cancelled under the event
// lock never calls again. Entries move between `queue` and `keptEntries` as map nodes, so a timer
// that has been started once needs no memory to run again.
#include "timer_table.h"

#include <algorithm>
#include <exception>
#include <utility>

#include "callback_table.h"
#include "clock.h"
#include "event_lock.h"
#include "event_loop.h"
#include "pal/CallGuarded.h"
#include "pal/kd_log.h"

namespace korvel_pal {

namespace {

// So many events at most between two looks at the event loop's other work: a timer that can never
// catch up must not shut out the rest.
constexpr int BATCH = 64;

bool isTimerType(KDint type) {
    return type == KD_TIMER_ONESHOT || type == KD_TIMER_PERIODIC_AVERAGE ||
           type == KD_TIMER_PERIODIC_MINIMUM;
}

}  // namespace

TimerTable& TimerTable::instance() {
    static Immortal<TimerTable> table;
    return table.get();
}

KDTimer* TimerTable::start(std::int64_t intervalNs, KDint type, void* userptr) {
    if (!Clock::isManual() && !EventLoop::instance().start()) {
        return nullptr;
    }
    KDTimer* handle = nullptr;
    bool isNext = false;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        handle = add(std::max<std::int64_t>(intervalNs, 1), type, userptr);
        if (handle == nullptr) {
            return nullptr;
        }
        const std::int64_t due = queue.begin()->first.first;
        isNext = queue.begin()->second == handle && !Clock::isManual() && due < loopWakesAt;
        loopWakesAt = isNext ? due : loopWakesAt;
    }
    if (isNext) {
        EventLoop::instance().wake();
    }
    return handle;
}

KDTimer* TimerTable::add(std::int64_t intervalNs, KDint type, void* userptr) {
    const std::int64_t due = addTime(Clock::now(), intervalNs);
    KDTimer* handle = nullptr;
    try {
        handle = timers.add({due, startedCount, intervalNs, type, userptr, true});
        keptEntries.insert(queue, {due, startedCount}, handle);
    } catch (const std::exception&) {
        timers.remove(handle);
        kdLogMessage("PAL: no memory for a timer");
        return nullptr;
    }
    ++startedCount;
    return handle;
}

bool TimerTable::cancel(KDTimer* handle) {
    const std::lock_guard<std::mutex> lock(mutex);
    const Timer* const timer = timers.find(handle);
    if (timer == nullptr) {
        return false;
    }
    if (timer->waiting) {
        keptEntries.keep(queue.extract({timer->due, timer->order}));
    }
    timers.remove(handle);
    return true;
}

std::int64_t TimerTable::timeToNext() {
    const std::lock_guard<std::mutex> lock(mutex);
    if (queue.empty() || Clock::isManual()) {
        loopWakesAt = std::numeric_limits<std::int64_t>::max();
        return NEVER;
    }
    loopWakesAt = queue.begin()->first.first;
    return std::max<std::int64_t>(queue.begin()->first.first - Clock::now(), 0);
}

void TimerTable::fireDue() {
    const std::int64_t now = Clock::now();
    for (int fired = 0; fired < BATCH; ++fired) {
        const EventLockGuard lock;
        KDEvent event{};
        if (EventLoop::instance().isStopping() || !takeDue(now, false, event)) {
            return;
        }
        callGuarded([&event] { CallbackTable::instance().deliver(event); });
    }
}

void TimerTable::useManualClock(std::int64_t now) {
    switchClock([now] { Clock::useManual(now); });
}

void TimerTable::useRealClock() {
    switchClock([] { Clock::useReal(); });
    EventLoop::instance().wake();
}

void TimerTable::advanceManualClock(std::int64_t nanoseconds) {
    const EventLockGuard lock;
    if (!Clock::isManual()) {
        return;
    }
    const std::int64_t end = addTime(Clock::now(), std::max<std::int64_t>(nanoseconds, 0));
    KDEvent event{};
    while (takeDue(end, true, event)) {
        callGuarded([&event] { CallbackTable::instance().deliver(event); });
    }
    // A callback may have moved the clock further, or chosen the real one.
    if (Clock::isManual() && Clock::now() < end) {
        Clock::useManual(end);
    }
}

// Moves the entry that the timer has already: what runs once can always run again.
void TimerTable::enqueue(Queue::node_type node, Timer& timer, std::int64_t due) {
    timer.due = due;
    timer.waiting = true;
    node.key() = {due, timer.order};
    queue.insert(std::move(node));
}

// Takes the next timer that is due up to `limit` and puts it back at its next time if it is
// periodic; moves the hand-driven clock to its due time.
bool TimerTable::takeDue(std::int64_t limit, bool manual, KDEvent& event) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (queue.empty() || Clock::isManual() != manual || queue.begin()->first.first > limit) {
        return false;
    }
    Queue::node_type node = queue.extract(queue.begin());
    KDTimer* const handle = node.mapped();
    Timer& timer = *timers.find(handle);
    timer.waiting = false;
    event = {timer.due, KD_EVENT_TIMER, timer.userptr, handle, nullptr};
    if (manual && Clock::now() < timer.due) {
        Clock::useManual(timer.due);
    }
    if (timer.type == KD_TIMER_PERIODIC_AVERAGE) {
        enqueue(std::move(node), timer, addTime(timer.due, timer.intervalNs));
    } else if (timer.type == KD_TIMER_PERIODIC_MINIMUM) {
        enqueue(std::move(node), timer, addTime(Clock::now(), timer.intervalNs));
    } else {
        keptEntries.keep(std::move(node));
    }
    return true;
}

template <typename SwitchClock>
void TimerTable::switchClock(SwitchClock change) {
    const EventLockGuard eventLock;
    const std::lock_guard<std::mutex> lock(mutex);
    const std::int64_t before = Clock::now();
    change();
    const std::int64_t now = Clock::now();
    Queue waiting;
    waiting.swap(queue);
    while (!waiting.empty()) {
        Queue::node_type node = waiting.extract(waiting.begin());
        const std::int64_t left = std::max<std::int64_t>(node.key().first - before, 0);
        Timer& timer = *timers.find(node.mapped());
        enqueue(std::move(node), timer, addTime(now, left));
    }
}

}  // namespace korvel_pal

KDTimer* kdSetTimer(KDint64 intervalNs, KDint periodic, void* eventuserptr) {
    if (!korvel_pal::isTimerType(periodic)) {
        return nullptr;
    }
    return korvel_pal::TimerTable::instance().start(intervalNs, periodic, eventuserptr);
}

KDint kdCancelTimer(KDTimer* timer) {
    return korvel_pal::TimerTable::instance().cancel(timer) ? 0 : -1;
}
