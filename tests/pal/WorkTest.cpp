#include <gmock/gmock.h>

#include <array>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "pal/kd_event.h"
#include "support/AssertCapture.h"

namespace {

/** A piece of work that waits until it is let go, and the record of what became of it. */
class Job {
  public:
    explicit Job(bool waits = false) : gateOpen(!waits) {}

    KDWork* queue() { return kdQueueWorkKOR(&Job::work, &Job::done, this); }

    void letGo() {
        const std::lock_guard<std::mutex> lock(mutex);
        gateOpen = true;
        changed.notify_all();
    }

    /** Waits until the record contains the text. */
    void waitFor(const std::string& part) {
        std::unique_lock<std::mutex> lock(mutex);
        changed.wait(lock, [this, &part] { return text.find(part) != std::string::npos; });
    }

    std::string record() {
        const std::lock_guard<std::mutex> lock(mutex);
        return text;
    }

    static void release(void* user) {
        static_cast<Job*>(user)->add(kdHoldsEventLockKOR() != 0 ? "R" : "?");
    }

    std::thread::id workThread;
    std::thread::id doneThread;

  private:
    static void work(void* user) {
        Job& self = *static_cast<Job*>(user);
        self.workThread = std::this_thread::get_id();
        self.add(kdHoldsEventLockKOR() == 0 ? "w" : "?");
        std::unique_lock<std::mutex> lock(self.mutex);
        self.changed.wait(lock, [&self] { return self.gateOpen; });
    }

    static void done(void* user) {
        Job& self = *static_cast<Job*>(user);
        self.doneThread = std::this_thread::get_id();
        self.add(kdHoldsEventLockKOR() != 0 ? "d" : "?");
    }

    void add(const char* what) {
        const std::lock_guard<std::mutex> lock(mutex);
        text += what;
        changed.notify_all();
    }

    std::mutex mutex;
    std::condition_variable changed;
    std::string text;
    bool gateOpen;
};

/**
 * Waits until all work that has begun is over, also that of which nothing is heard: only then are
 * all workers free at a time.
 */
void settle() {
    std::array<std::unique_ptr<Job>, 4> all;
    for (std::unique_ptr<Job>& each : all) {
        each = std::make_unique<Job>(true);
        each->queue();
        each->waitFor("w");
    }
    for (const std::unique_ptr<Job>& each : all) {
        each->letGo();
        each->waitFor("wd");
    }
    EXPECT_EQ(kdDrainEventsKOR(), 0);
}

TEST(Work, RunsWithoutTheLockAndCompletesOnTheEventThreadUnderIt) {
    Job job;
    EXPECT_NE(job.queue(), nullptr);
    job.waitFor("wd");
    EXPECT_NE(job.workThread, job.doneThread);
    EXPECT_NE(job.doneThread, std::this_thread::get_id());
    EXPECT_EQ(kdDrainEventsKOR(), 0);
}

TEST(Work, MayBlockWithoutHoldingUpTheEventThread) {
    Job job(true);
    job.queue();
    job.waitFor("w");
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    EXPECT_EQ(job.record(), "w");
    job.letGo();
    job.waitFor("wd");
}

TEST(Work, CancelledAtOnceReleasesWhetherItHasBegunOrNot) {
    Job job;
    kdEventLockKOR();
    KDWork* const work = job.queue();
    kdCancelWorkKOR(work, &Job::release);
    kdEventUnlockKOR();
    job.waitFor("R");
    settle();
    EXPECT_THAT(job.record(), ::testing::AnyOf("R", "wR"));
}

TEST(Work, CancelledWhileRunningReleasesOnceItHasEnded) {
    Job job(true);
    KDWork* const work = job.queue();
    job.waitFor("w");
    kdCancelWorkKOR(work, &Job::release);
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    EXPECT_EQ(job.record(), "w");
    job.letGo();
    job.waitFor("wR");
    settle();
    EXPECT_EQ(job.record(), "wR");
}

TEST(Work, CancelledWhileItWaitsForAWorkerNeverRuns) {
    std::vector<std::unique_ptr<Job>> blockers;
    for (int i = 0; i < 4; ++i) {
        blockers.push_back(std::make_unique<Job>(true));
        blockers.back()->queue();
        blockers.back()->waitFor("w");
    }
    Job waiting;
    KDWork* const work = waiting.queue();
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    kdCancelWorkKOR(work, &Job::release);
    waiting.waitFor("R");
    for (const std::unique_ptr<Job>& blocker : blockers) {
        EXPECT_EQ(blocker->record(), "w");
        blocker->letGo();
        blocker->waitFor("wd");
    }
    EXPECT_EQ(waiting.record(), "R");
    EXPECT_EQ(kdDrainEventsKOR(), 0);
}

TEST(Work, CancelledTwiceReleasesOnce) {
    Job job(true);
    KDWork* const work = job.queue();
    job.waitFor("w");
    kdCancelWorkKOR(work, &Job::release);
    kdCancelWorkKOR(work, &Job::release);
    job.letGo();
    job.waitFor("wR");
    kdCancelWorkKOR(work, &Job::release);
    settle();
    EXPECT_EQ(job.record(), "wR");
}

TEST(Work, CancellingAfterCompletionDoesNothing) {
    Job job;
    KDWork* const work = job.queue();
    job.waitFor("wd");
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    kdCancelWorkKOR(work, &Job::release);
    kdCancelWorkKOR(nullptr, &Job::release);
    settle();
    EXPECT_EQ(job.record(), "wd");
}

TEST(Work, CancelledUnderTheLockNeverCompletes) {
    for (int round = 0; round < 100; ++round) {
        Job job;
        KDWork* const work = job.queue();
        if (round % 2 == 0) {
            job.waitFor("w");
        }
        kdEventLockKOR();
        const bool completed = job.record() == "wd";
        kdCancelWorkKOR(work, &Job::release);
        kdEventUnlockKOR();
        if (!completed) {
            job.waitFor("R");
        }
        settle();
        EXPECT_EQ(job.record().find('d') != std::string::npos, completed);
    }
}

TEST(Work, AcceptsNoCompletionAndNoRelease) {
    Job job(true);
    KDWork* const quiet = kdQueueWorkKOR([](void*) {}, nullptr, nullptr);
    EXPECT_NE(quiet, nullptr);
    KDWork* const cancelled = job.queue();
    job.waitFor("w");
    kdCancelWorkKOR(cancelled, nullptr);
    job.letGo();
    settle();
    EXPECT_EQ(job.record(), "w");
}

TEST(Work, AssertsWithoutAFunction) {
    const TestSupport::AssertCapture asserts;
    EXPECT_EQ(kdQueueWorkKOR(nullptr, nullptr, nullptr), nullptr);
    EXPECT_EQ(asserts.count(), 1u);
    EXPECT_EQ(asserts.reports().at(0).condition, "work");
}

}  // namespace
