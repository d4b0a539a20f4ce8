#include "work_queue.h"

#include <utility>

#include "event_lock.h"
#include "event_loop.h"
#include "pal/kd_assert.h"

namespace korvel_pal {

WorkQueue& WorkQueue::instance() {
    static WorkQueue* const queue = new WorkQueue;
    return *queue;
}

KDWork* WorkQueue::add(void (*work)(void*), void (*done)(void*), void* user) {
    auto entry = std::make_unique<Work>();
    Work& added = *entry;
    added.work = work;
    added.done = done;
    added.user = user;
    added.request.data = &added;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        added.handle = works.add(std::move(entry));
    }
    // Once it is posted, the entry may end at any moment.
    KDWork* const handle = added.handle;
    EventLoop::instance().post(&WorkQueue::submit, handle);
    return handle;
}

void WorkQueue::cancel(KDWork* handle, void (*release)(void*)) {
    const EventLockGuard lock;
    Work* const work = find(handle);
    if (work == nullptr || work->cancelled) {
        return;
    }
    work->cancelled = true;
    work->release = release;
    EventLoop::instance().post(&WorkQueue::takeBack, handle);
}

void WorkQueue::cancelSubmitted() {
    const std::lock_guard<std::mutex> lock(mutex);
    works.forEach([](KDWork*, std::unique_ptr<Work>& work) {
        if (work->submitted) {
            uv_cancel(reinterpret_cast<uv_req_t*>(&work->request));
        }
    });
}

WorkQueue::Work* WorkQueue::find(KDWork* handle) {
    const std::lock_guard<std::mutex> lock(mutex);
    const std::unique_ptr<Work>* const found = works.find(handle);
    return found == nullptr ? nullptr : found->get();
}

// Under the event lock.
void WorkQueue::finish(KDWork* handle) {
    std::unique_ptr<Work> work;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        work = std::move(*works.find(handle));
        works.remove(handle);
    }
    void (*const call)(void*) = work->cancelled ? work->release : work->done;
    if (call != nullptr) {
        call(work->user);
    }
}

void WorkQueue::submit(void* handle) {
    WorkQueue& self = instance();
    Work* const work = self.find(static_cast<KDWork*>(handle));
    if (work->cancelled) {
        self.finish(work->handle);
        return;
    }
    work->submitted = true;
    uv_queue_work(EventLoop::instance().uvLoop(), &work->request, &WorkQueue::onWork,
                  &WorkQueue::onWorkDone);
}

void WorkQueue::takeBack(void* handle) {
    Work* const work = instance().find(static_cast<KDWork*>(handle));
    if (work != nullptr) {
        uv_cancel(reinterpret_cast<uv_req_t*>(&work->request));
    }
}

void WorkQueue::onWork(uv_work_t* request) {
    const Work& work = *static_cast<Work*>(request->data);
    work.work(work.user);
}

void WorkQueue::onWorkDone(uv_work_t* request, int /*status*/) {
    const EventLockGuard lock;
    Work& work = *static_cast<Work*>(request->data);
    // Libuv must not be asked for it any more.
    work.submitted = false;
    // At the end of the process the owner may be gone already; the entry then stays in the table.
    if (!EventLoop::instance().isStopping()) {
        instance().finish(work.handle);
    }
}

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
