// A piece of work goes from `waiting` over a worker to `completed`, and from there to the event
// thread, which calls `done`, or `release` if the work was cancelled. An entry is its own link in
// these lines, so that nothing can fail on the way once it has been accepted.
//
// Cancelling waits for nobody. Work that waits is completed at once; work that runs is only marked,
// and its worker never looks at the mark. The mark belongs to the event lock, under which both the
// canceller and `deliverOne` hold it, so exactly one of `done` and `release` is called.
#include "work_queue.h"

#include <pthread.h>

#include <exception>

#include "event_lock.h"
#include "event_loop.h"
#include "pal/CallGuarded.h"
#include "pal/SignalsBlocked.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"

namespace korvel_pal {

void WorkQueue::Line::push(Work* work) {
    work->next = nullptr;
    (last != nullptr ? last->next : first) = work;
    last = work;
    ++count;
}

WorkQueue::Work* WorkQueue::Line::pop() {
    Work* const work = first;
    if (work != nullptr) {
        remove(work);
    }
    return work;
}

void WorkQueue::Line::remove(Work* work) {
    Work* before = nullptr;
    for (Work* each = first; each != work; each = each->next) {
        before = each;
    }
    (before != nullptr ? before->next : first) = work->next;
    last = last == work ? before : last;
    --count;
}

WorkQueue& WorkQueue::instance() {
    static Immortal<WorkQueue> queue;
    return queue.get();
}

KDWork* WorkQueue::add(void (*work)(void*), void (*done)(void*), void* user) {
    if (!EventLoop::instance().start()) {
        return nullptr;
    }
    const std::lock_guard<std::mutex> lock(mutex);
    KDWork* handle = nullptr;
    try {
        handle = works.add(Work());
    } catch (const std::exception&) {
        kdLogMessage("PAL: no memory for background work");
        return nullptr;
    }
    Work* const added = works.find(handle);
    added->handle = handle;
    added->work = work;
    added->done = done;
    added->user = user;
    if (ending) {
        return handle;
    }
    waiting.push(added);
    if (waiting.size() > idleCount && workerCount < WORKERS_MAX) {
        startWorker();
    }
    wakeSignal.notifyOne();
    return handle;
}

void WorkQueue::cancel(KDWork* handle, void (*release)(void*)) {
    const EventLockGuard eventLock;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        Work* const work = works.find(handle);
        if (work == nullptr || work->cancelled) {
            return;
        }
        work->cancelled = true;
        work->release = release;
        if (ending || work->state != State::WAITING) {
            return;
        }
        waiting.remove(work);
        complete(work);
    }
    EventLoop::instance().wake();
}

void WorkQueue::complete(Work* finished) {
    finished->state = State::COMPLETED;
    completed.push(finished);
}

// No more than there is now: what completes meanwhile must not keep the timers waiting.
void WorkQueue::deliverCompleted() {
    std::size_t count = 0;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        count = completed.size();
    }
    while (count > 0 && deliverOne()) {
        --count;
    }
}

bool WorkQueue::deliverOne() {
    const EventLockGuard eventLock;
    // At the end of the process the owner may be gone already; the entry then stays in the table.
    if (EventLoop::instance().isStopping()) {
        return false;
    }
    void (*call)(void*) = nullptr;
    void* user = nullptr;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        const Work* const work = completed.pop();
        call = work->cancelled ? work->release : work->done;
        user = work->user;
        works.remove(work->handle);
    }
    if (call != nullptr) {
        callGuarded([call, user] { call(user); });
    }
    return true;
}

bool WorkQueue::startFirstWorker() {
    const std::lock_guard<std::mutex> lock(mutex);
    return workerCount > 0 || startWorker();
}

bool WorkQueue::startWorker() {
    const SignalsBlocked signalsBlocked;
    try {
        workers[workerCount] = std::thread(&WorkQueue::runWorker, this);
    } catch (const std::exception& exception) {
        kdLogFormatMessage("PAL: a worker thread cannot start: %s", exception.what());
        return false;
    }
    ++workerCount;
    ++idleCount;
    return true;
}

void WorkQueue::endWorkers() {
    end();
    waitForWorkers();
    const std::lock_guard<std::mutex> lock(mutex);
    workerCount = 0;
    idleCount = 0;
    ending = false;
}

void WorkQueue::end() {
    const std::lock_guard<std::mutex> lock(mutex);
    ending = true;
    wakeSignal.notifyAll();
}

void WorkQueue::waitForWorkers() {
    for (std::thread& worker : workers) {
        if (worker.joinable()) {
            worker.join();
        }
    }
}

void WorkQueue::runWorker() {
#if defined(__linux__)
    pthread_setname_np(pthread_self(), "talvox-worker");
#endif
    while (Work* const taken = takeWaiting()) {
        callGuarded([taken] { taken->work(taken->user); });
        {
            const std::lock_guard<std::mutex> lock(mutex);
            complete(taken);
            ++idleCount;
        }
        EventLoop::instance().wake();
    }
}

WorkQueue::Work* WorkQueue::takeWaiting() {
    std::unique_lock<std::mutex> lock(mutex);
    Work* taken = nullptr;
    while (!ending && taken == nullptr) {
        taken = waiting.pop();
        if (taken == nullptr) {
            wakeSignal.wait(lock);
        }
    }
    if (taken != nullptr) {
        taken->state = State::RUNNING;
        --idleCount;
    }
    return taken;
}

namespace {

/** After the static objects of the process have gone: work that runs may still need its code. */
__attribute__((destructor)) void waitForWorkersAtUnload() {
    WorkQueue::instance().waitForWorkers();
}

}  // namespace

}  // namespace korvel_pal

KDWork* kdQueueWorkKOR(void (*work)(void* user), void (*done)(void* user), void* user) {
    if (!KOR_ASSERT(work)) {
        return nullptr;
    }
    return korvel_pal::WorkQueue::instance().add(work, done, user);
}

void kdCancelWorkKOR(KDWork* work, void (*release)(void* user)) {
    korvel_pal::WorkQueue::instance().cancel(work, release);
}
