#include "core/tasking/TaskManager.h"

#include <algorithm>
#include <boost/enable_shared_from_this.hpp>
#include <boost/make_shared.hpp>
#include <cstddef>
#include <memory>
#include <utility>
#include <vector>

#include "pal/kd_assert.h"
#include "pal/kd_event.h"

namespace Tasking {

/**
 * The tasks that are queued or run and have not been cancelled. Used under the event lock; lives
 * until the platform layer has let go of the last job.
 */
class TaskManager::Impl : public boost::enable_shared_from_this<TaskManager::Impl> {
  public:
    Impl() { spareJobs.reserve(SPARE_JOBS_MAX); }

    bool add(const boost::shared_ptr<Task>& task) {
        if (!KOR_ASSERT(find(task) == jobs.end())) {
            return false;
        }
        jobs.reserve(jobs.size() + 1);
        std::unique_ptr<Job> job = makeJob();
        job->impl = shared_from_this();
        job->task = task;
        job->work = kdQueueWorkKOR(&Job::run, &Job::complete, job.get());
        const bool isQueued = job->work != nullptr;
        if (isQueued) {
            jobs.push_back(job.release());
        }
        return isQueued;
    }

    void cancel(const boost::shared_ptr<Task>& task) {
        const auto found = find(task);
        if (found != jobs.end()) {
            KDWork* const work = (*found)->work;
            jobs.erase(found);
            kdCancelWorkKOR(work, &Job::release);
        }
    }

    void cancelAll() {
        for (const Job* job : jobs) {
            kdCancelWorkKOR(job->work, &Job::release);
        }
        jobs.clear();
    }

  private:
    /** What the platform layer keeps while it has the work. */
    struct Job {
        boost::shared_ptr<Impl> impl;
        boost::shared_ptr<Task> task;
        KDWork* work = nullptr;

        static void run(void* job) { static_cast<Job*>(job)->task->runTask(); }

        static void complete(void* user) {
            auto* const job = static_cast<Job*>(user);
            auto& running = job->impl->jobs;
            running.erase(std::find(running.begin(), running.end(), job));
            const boost::shared_ptr<Task> task = job->task;
            release(job);
            task->onTaskCompleted();
        }

        static void release(void* user) {
            std::unique_ptr<Job> job(static_cast<Job*>(user));
            const boost::shared_ptr<Impl> impl = std::move(job->impl);
            const boost::shared_ptr<Task> task = std::move(job->task);
            if (impl->spareJobs.size() < SPARE_JOBS_MAX) {
                impl->spareJobs.push_back(std::move(job));
            }
        }
    };

    static constexpr std::size_t SPARE_JOBS_MAX = 8;

    std::vector<Job*>::iterator find(const boost::shared_ptr<Task>& task) {
        return std::find_if(jobs.begin(), jobs.end(),
                            [&task](const Job* job) { return job->task == task; });
    }

    std::unique_ptr<Job> makeJob() {
        if (spareJobs.empty()) {
            return std::make_unique<Job>();
        }
        std::unique_ptr<Job> job = std::move(spareJobs.back());
        spareJobs.pop_back();
        return job;
    }

    std::vector<Job*> jobs;
    std::vector<std::unique_ptr<Job>> spareJobs;
};

TaskManager& TaskManager::getInstance() {
    return instance();
}

TaskManager::TaskManager() : impl(boost::make_shared<Impl>()) {}

TaskManager::~TaskManager() {
    const Util::EventLock lock;
    impl->cancelAll();
}

bool TaskManager::addTask(const boost::shared_ptr<Task>& task, int /*priority*/) {
    const Util::EventLock lock;
    return KOR_ASSERT(task) && impl->add(task);
}

void TaskManager::cancelTask(const boost::shared_ptr<Task>& task) {
    const Util::EventLock lock;
    impl->cancel(task);
}

}  // namespace Tasking
