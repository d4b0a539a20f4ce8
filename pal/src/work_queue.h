#pragma once

#include <array>
#include <cstddef>
#include <mutex>
#include <thread>

#include "handle_table.h"
#include "immortal.h"
#include "pal/kd_event.h"
#include "wake_signal.h"

namespace korvel_pal {

/**
 * Background work and its workers. The first worker starts with the event thread, so that whatever
 * is accepted later finds one; the others start when there is work for them, and are done without
 * where there is no thread for them. Never destroyed, like the event loop.
 */
class WorkQueue {
  public:
    static WorkQueue& instance();

    /** Null when there is no memory, or no thread and never was. */
    KDWork* add(void (*work)(void*), void (*done)(void*), void* user);
    void cancel(KDWork* handle, void (*release)(void*));

    /** Calls what is to be called for finished and cancelled work. On the event thread. */
    void deliverCompleted();

    /** For the start of the event thread. @return false when there is no thread */
    bool startFirstWorker();

    /** Ends all workers and waits for them, for a start that cannot be completed. */
    void endWorkers();

    /** The process ends: nothing is begun any more. Does not wait for what runs. */
    void end();

    /** Waits for work that runs. After `end`. */
    void waitForWorkers();

  private:
    friend class Immortal<WorkQueue>;
    static constexpr std::size_t WORKERS_MAX = 4;

    enum class State { WAITING, RUNNING, COMPLETED };

    struct Work {
        KDWork* handle = nullptr;
        void (*work)(void*) = nullptr;
        void (*done)(void*) = nullptr;
        void (*release)(void*) = nullptr;
        void* user = nullptr;
        State state = State::WAITING;
        bool cancelled = false;
        Work* next = nullptr;
    };

    /** First in, first out. The works are its own links, so that moving one cannot fail. */
    class Line {
      public:
        void push(Work* work);
        Work* pop();
        void remove(Work* work);
        std::size_t size() const { return count; }

      private:
        Work* first = nullptr;
        Work* last = nullptr;
        std::size_t count = 0;
    };

    WorkQueue() = default;

    Work* takeWaiting();
    bool startWorker();
    void runWorker();
    void complete(Work* finished);
    bool deliverOne();

    std::mutex mutex;
    WakeSignal wakeSignal;
    // Guarded by the mutex; `cancelled` and `release` of an entry by the event lock.
    HandleTable<KDWork, Work> works;
    Line waiting;
    Line completed;
    std::array<std::thread, WORKERS_MAX> workers;
    std::size_t workerCount = 0;
    std::size_t idleCount = 0;
    bool ending = false;
};

}  // namespace korvel_pal
