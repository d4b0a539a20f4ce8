/**
 * @file
 * A piece of background work.
 */
#pragma once

#include <boost/enable_shared_from_this.hpp>

#include "core/Export.h"

namespace Tasking {

/** Work for the task manager. Always owned by shared pointer. */
class KORVEL_CORE_API Task : public boost::enable_shared_from_this<Task> {
  public:
    Task();
    Task(const Task&) = delete;
    Task& operator=(const Task&) = delete;

    /** The work; runs once, on a worker thread, without any lock. May block. Must not throw. */
    virtual void runTask() = 0;

    /**
     * The work is done; called once, on the event thread under the event lock, unless the task was
     * cancelled before.
     */
    virtual void onTaskCompleted() = 0;

    virtual ~Task();
};

}  // namespace Tasking
