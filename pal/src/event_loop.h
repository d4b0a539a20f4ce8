#pragma once

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <thread>
#include <vector>

#include "immortal.h"
#include "pal/kd_event.h"
#include "wake_signal.h"

namespace korvel_pal {

/**
 * The event thread and its queue. Started by the first use, together with the first worker, and
 * stopped when the process ends; what is asked of it later is dropped. It needs a thread and some
 * memory, no descriptors: a start that fails leaves nothing behind, and the next use tries again.
 * The object itself is never destroyed, because other threads may still call it then.
 */
class EventLoop {
  public:
    static EventLoop& instance();

    /** @return whether the event thread runs now; true also when the process ends */
    bool start();

    /** @return false when the function will not run: no thread or no memory for it */
    bool post(void (*func)(void*), void* user);

    /** Makes the event thread look at timers and completed work. */
    void wake();

    /** See `kdDrainEventsKOR`. */
    bool drain();

    /** Ends the event thread; waits for it and for any other callback, but not for ever. */
    void stop();

    bool isStopping() const { return stopping.load(std::memory_order_acquire); }

    /** A callback did not return in time when deliveries ended. */
    bool isBlocked() const { return blocked.load(std::memory_order_acquire); }

  private:
    friend class Immortal<EventLoop>;

    struct Post {
        void (*func)(void*);
        void* user;
    };

    EventLoop() = default;

    bool startThreads();
    bool waitForCallbacks();
    void run();
    void runPosts();
    void sleep();

    std::mutex mutex;
    WakeSignal wakeSignal;
    std::condition_variable changed;
    // Guarded by the mutex.
    bool started = false;
    bool finished = false;
    bool awake = false;  // something happened since the thread last looked
    std::vector<Post> pending;
    std::uint64_t postedCount = 0;
    std::uint64_t handledCount = 0;

    std::atomic<bool> stopping{false};
    std::atomic<bool> blocked{false};
    std::thread thread;

    // Of the event thread.
    std::vector<Post> current;
};

}  // namespace korvel_pal
