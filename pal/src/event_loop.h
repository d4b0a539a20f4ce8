#pragma once

#include <uv.h>

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <thread>
#include <vector>

#include "pal/kd_event.h"

namespace korvel_pal {

/**
 * The event thread and its queue. Started by the first use, stopped when the process ends; what is
 * asked of it later is dropped. The object itself is never destroyed, because other threads may
 * still call it then.
 */
class EventLoop {
  public:
    static EventLoop& instance();

    void post(void (*func)(void*), void* user);

    /** Makes the event thread look at the timers. */
    void wake();

    /** See `kdDrainEventsKOR`. */
    bool drain();

    /** Ends the event thread; waits for it and for any other callback, but not for ever. */
    void stop();

    bool isStopping() const { return stopping.load(std::memory_order_acquire); }

    /** A callback did not return in time when deliveries ended. */
    bool isBlocked() const { return blocked.load(std::memory_order_acquire); }

    /** For the event thread only. */
    uv_loop_t* uvLoop() { return &loop; }

  private:
    struct Post {
        void (*func)(void*);
        void* user;
    };

    EventLoop() = default;

    bool start();
    bool waitForCallbacks();
    void run();
    void runPosts();
    void serveTimers();
    void closeHandles();
    static void onWake(uv_async_t* handle);
    static void onTimer(uv_timer_t* handle);

    std::mutex mutex;
    std::condition_variable changed;
    // Guarded by the mutex.
    bool started = false;
    bool finished = false;
    std::vector<Post> pending;
    std::uint64_t postedCount = 0;
    std::uint64_t handledCount = 0;

    std::atomic<bool> stopping{false};
    std::atomic<bool> blocked{false};
    std::thread thread;

    // Of the event thread, apart from sending to `async`, which the mutex guards.
    uv_loop_t loop{};
    uv_async_t async{};
    uv_timer_t timer{};
    std::vector<Post> current;
};

}  // namespace korvel_pal
