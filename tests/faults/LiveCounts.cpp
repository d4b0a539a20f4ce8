#include "LiveCounts.h"

#include <dlfcn.h>

#include <atomic>
#include <chrono>
#include <map>
#include <mutex>
#include <set>
#include <thread>

#include "pal/kd_event.h"
#include "support/Threads.h"

namespace {

std::mutex mutex;

std::set<KDTimer*>& liveTimers() {
    static auto* const live = new std::set<KDTimer*>;
    return *live;
}

/** Background work with what it was queued with. */
struct Job {
    void (*work)(void* user);
    void (*done)(void* user);
    void (*release)(void* user);
    void* user;
    KDWork* handle;
};

std::map<KDWork*, Job*>& jobs() {
    static auto* const live = new std::map<KDWork*, Job*>;
    return *live;
}

std::atomic<std::size_t> liveJobs{0};

void forget(const Job* job) {
    const std::lock_guard<std::mutex> lock(mutex);
    const auto entry = jobs().find(job->handle);
    if (entry != jobs().end() && entry->second == job) {
        jobs().erase(entry);
    }
}

void endJob(Job* job, void (*end)(void* user)) {
    forget(job);
    void* const user = job->user;
    delete job;
    --liveJobs;
    if (end != nullptr) {
        end(user);
    }
}

template <typename Function>
Function findNext(const char* name) {
    return reinterpret_cast<Function>(::dlsym(RTLD_NEXT, name));
}

}  // namespace

// In front of the platform layer's functions, for this program and the libraries that it loads.
extern "C" {

KD_API KDTimer* kdSetTimer(KDint64 intervalNs, KDint periodic, void* eventuserptr) {
    static const auto real = findNext<decltype(&kdSetTimer)>("kdSetTimer");
    KDTimer* const timer = real(intervalNs, periodic, eventuserptr);
    const std::lock_guard<std::mutex> lock(mutex);
    if (timer != nullptr) {
        liveTimers().insert(timer);
    }
    return timer;
}

KD_API KDint kdCancelTimer(KDTimer* timer) {
    static const auto real = findNext<decltype(&kdCancelTimer)>("kdCancelTimer");
    {
        // Forgotten first: its handle may be used again as soon as it is free.
        const std::lock_guard<std::mutex> lock(mutex);
        liveTimers().erase(timer);
    }
    return real(timer);
}

KD_API KDWork* kdQueueWorkKOR(void (*work)(void* user), void (*done)(void* user), void* user) {
    static const auto real = findNext<decltype(&kdQueueWorkKOR)>("kdQueueWorkKOR");
    auto* const job = new Job{work, done, nullptr, user, nullptr};
    ++liveJobs;
    kdEventLockKOR();
    job->handle =
        real([](void* queued) { static_cast<Job*>(queued)->work(static_cast<Job*>(queued)->user); },
             [](void* queued) {
                 auto* const finished = static_cast<Job*>(queued);
                 endJob(finished, finished->done);
             },
             job);
    KDWork* const handle = job->handle;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        jobs()[handle] = job;
    }
    kdEventUnlockKOR();
    return handle;
}

KD_API void kdCancelWorkKOR(KDWork* work, void (*release)(void* user)) {
    static const auto real = findNext<decltype(&kdCancelWorkKOR)>("kdCancelWorkKOR");
    {
        const std::lock_guard<std::mutex> lock(mutex);
        const auto entry = jobs().find(work);
        if (entry == jobs().end()) {
            return;
        }
        entry->second->release = release;
        jobs().erase(entry);
    }
    real(work, [](void* queued) {
        auto* const cancelled = static_cast<Job*>(queued);
        endJob(cancelled, cancelled->release);
    });
}
}

namespace FaultTest {

LiveCounts LiveCounts::now() {
    LiveCounts counts;
    counts.descriptors = TestSupport::countEntries("/proc/self/fd");
    counts.threads = TestSupport::countThreads();
    const std::lock_guard<std::mutex> lock(mutex);
    counts.timers = liveTimers().size();
    counts.tasks = countTasks();
    return counts;
}

std::size_t LiveCounts::countTasks() {
    return liveJobs;
}

bool LiveCounts::operator==(const LiveCounts& other) const {
    return descriptors == other.descriptors && threads == other.threads && timers == other.timers &&
           tasks == other.tasks;
}

void PrintTo(const LiveCounts& counts, std::ostream* out) {
    *out << counts.descriptors << " descriptors, " << counts.threads << " threads, "
         << counts.timers << " timers, " << counts.tasks << " tasks";
}

LiveCounts waitForCounts(const LiveCounts& expected) {
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    LiveCounts counts = LiveCounts::now();
    while (!(counts == expected) && std::chrono::steady_clock::now() < deadline) {
        std::this_thread::yield();
        counts = LiveCounts::now();
    }
    return counts;
}

}  // namespace FaultTest
