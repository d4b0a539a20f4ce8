#include "core/tasking/TaskManager.h"

#include <map>
#include <memory>

#include "pal/kd_assert.h"
#include "pal/kd_event.h"

namespace Tasking {

/** The tasks that are queued or run and have not been cancelled. Used under the event lock. */
class TaskManager::Impl {
  public:
    ~Impl() {
        for (const auto& entry : works) {
            kdCancelWorkKOR(entry.second, &Job::release);
        }
    }

    void add(const boost::shared_ptr<Task>& task) {
        KDWork*& work = works[task.get()];
        if (KOR_ASSERT(work == nullptr)) {
            work = kdQueueWorkKOR(&Job::run, &Job::complete, new Job{*this, task});
        }
    }

    void cancel(const boost::shared_ptr<Task>& task) {
        const auto found = works.find(task.get());
        if (found != works.end()) {
            KDWork* const work = found->second;
            works.erase(found);
            kdCancelWorkKOR(work, &Job::release);
        }
    }

  private:
    /** What the platform layer keeps while it has the work; not cancelled means `impl` lives. */
    struct Job {
        Impl& impl;
        boost::shared_ptr<Task> task;

        static void run(void* job) { static_cast<Job*>(job)->task->runTask(); }

        static void complete(void* job) {
            const std::unique_ptr<Job> completed(static_cast<Job*>(job));
            completed->impl.works.erase(completed->task.get());
            completed->task->onTaskCompleted();
        }

        static void release(void* job) { delete static_cast<Job*>(job); }
    };

    std::map<const Task*, KDWork*> works;
};

TaskManager& TaskManager::getInstance() {
    return instance();
}

TaskManager::TaskManager() : impl(new Impl) {}

TaskManager::~TaskManager() {
    const Util::EventLock lock;
    impl.reset();
}

void TaskManager::addTask(const boost::shared_ptr<Task>& task, int /*priority*/) {
    const Util::EventLock lock;
    if (KOR_ASSERT(task)) {
        impl->add(task);
    }
}

void TaskManager::cancelTask(const boost::shared_ptr<Task>& task) {
    const Util::EventLock lock;
    impl->cancel(task);
}

}  // namespace Tasking
