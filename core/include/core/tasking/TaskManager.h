/**
 * @file
 * The shared worker pool.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "core/Export.h"
#include "core/tasking/Task.h"
#include "core/util/Singleton.h"

namespace Tasking {

/**
 * Runs tasks on the platform layer's workers. All operations take the event lock. The process
 * cannot end while a task runs, so that tasks are to be short.
 */
class KORVEL_CORE_API TaskManager : public Util::Singleton<TaskManager> {
  public:
    /** The one of the process, made on first use. */
    static TaskManager& getInstance();
    ~TaskManager() override;

    /**
     * Queues a task; it is kept alive until it has completed or its cancellation has taken effect.
     * @param priority reserved; pass 0
     * @return false when the task will not run: there is no memory or no thread for it, or it is a
     *         broken invariant (no task, or one that is queued already)
     */
    bool addTask(const boost::shared_ptr<Task>& task, int priority);

    /**
     * Guarantees that the task's `onTaskCompleted` is not called any more; never waits for the
     * work, which may still be running. Does nothing for a task that is not queued or running.
     */
    void cancelTask(const boost::shared_ptr<Task>& task);

  private:
    friend class Util::Singleton<TaskManager>;
    TaskManager();

    class Impl;
    const boost::shared_ptr<Impl> impl;
};

}  // namespace Tasking
