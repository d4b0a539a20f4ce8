#pragma once

#include <uv.h>

#include <memory>
#include <mutex>

#include "handle_table.h"
#include "pal/kd_event.h"

namespace korvel_pal {

/** Background work on libuv's workers. Never destroyed, like the event loop. */
class WorkQueue {
  public:
    static WorkQueue& instance();

    KDWork* add(void (*work)(void*), void (*done)(void*), void* user);
    void cancel(KDWork* handle, void (*release)(void*));

    /** Takes back what no worker has begun. On the event thread, when it ends. */
    void cancelSubmitted();

  private:
    struct Work {
        uv_work_t request{};
        KDWork* handle = nullptr;
        void (*work)(void*) = nullptr;
        void (*done)(void*) = nullptr;
        void (*release)(void*) = nullptr;
        void* user = nullptr;
        bool submitted = false;
        bool cancelled = false;
    };

    WorkQueue() = default;

    Work* find(KDWork* handle);
    void finish(KDWork* handle);
    static void submit(void* handle);
    static void takeBack(void* handle);
    static void onWork(uv_work_t* request);
    static void onWorkDone(uv_work_t* request, int status);

    std::mutex mutex;
    // The table is guarded by the mutex, `cancelled` and `release` by the event lock; `submitted`
    // belongs to the event thread.
    HandleTable<KDWork, std::unique_ptr<Work>> works;
};

}  // namespace korvel_pal
