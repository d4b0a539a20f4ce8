#include "core/tasking/TaskManager.h"

#include <gmock/gmock.h>

#include <array>
#include <boost/make_shared.hpp>
#include <condition_variable>
#include <cstdlib>
#include <functional>
#include <future>
#include <mutex>
#include <string>
#include <thread>

#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "support/AssertCapture.h"

using Tasking::TaskManager;

namespace {

/** What became of the tasks of one test; outlives them. */
class Record {
  public:
    void add(const char* what) {
        const std::lock_guard<std::mutex> lock(mutex);
        text += what;
        changed.notify_all();
    }

    void waitFor(const std::string& part) {
        std::unique_lock<std::mutex> lock(mutex);
        changed.wait(lock, [this, &part] { return text.find(part) != std::string::npos; });
    }

    std::string get() {
        const std::lock_guard<std::mutex> lock(mutex);
        return text;
    }

    void openGate() {
        const std::lock_guard<std::mutex> lock(mutex);
        gateOpen = true;
        changed.notify_all();
    }

    void waitForGate() {
        std::unique_lock<std::mutex> lock(mutex);
        changed.wait(lock, [this] { return gateOpen; });
    }

  private:
    std::mutex mutex;
    std::condition_variable changed;
    std::string text;
    bool gateOpen = false;
};

/** Notes "r" when it runs, "c" when it completes and "~" when it is destroyed. */
class TestTask : public Tasking::Task {
  public:
    explicit TestTask(Record& noted) : record(noted) {}
    ~TestTask() override { record.add("~"); }

    void runTask() override {
        record.add(kdHoldsEventLockKOR() == 0 ? "r" : "?");
        if (waits) {
            record.waitForGate();
        }
    }

    void onTaskCompleted() override {
        record.add(kdHoldsEventLockKOR() != 0 ? "c" : "?");
        if (reaction) {
            reaction();
        }
    }

    bool waits = false;
    std::function<void()> reaction;

  private:
    Record& record;
};

class Tasks : public ::testing::Test {
  protected:
    TaskManager& manager = TaskManager::getInstance();
    Record record;
};

TEST_F(Tasks, RunThenCompleteThenAreLetGo) {
    manager.addTask(boost::make_shared<TestTask>(record), 0);
    record.waitFor("~");
    EXPECT_EQ(record.get(), "rc~");
}

TEST_F(Tasks, RunOffTheEventThread) {
    class ThreadTask : public Tasking::Task {
      public:
        void runTask() override { ran = std::this_thread::get_id(); }
        void onTaskCompleted() override { completed.set_value({ran, std::this_thread::get_id()}); }
        std::thread::id ran;
        std::promise<std::pair<std::thread::id, std::thread::id>> completed;
    };
    const auto task = boost::make_shared<ThreadTask>();
    manager.addTask(task, 0);
    const auto threads = task->completed.get_future().get();
    EXPECT_NE(threads.first, threads.second);
    EXPECT_NE(threads.second, std::this_thread::get_id());
    EXPECT_EQ(kdDrainEventsKOR(), 0);
}

TEST_F(Tasks, CancelledBeforeTheyRunNeverDo) {
    std::array<Record, 4> busy;  // as many as there are workers
    for (Record& each : busy) {
        const auto blocker = boost::make_shared<TestTask>(each);
        blocker->waits = true;
        EXPECT_TRUE(manager.addTask(blocker, 0));
        each.waitFor("r");
    }
    {
        const auto task = boost::make_shared<TestTask>(record);
        EXPECT_TRUE(manager.addTask(task, 0));
        manager.cancelTask(task);
    }
    record.waitFor("~");
    EXPECT_EQ(record.get(), "~");
    for (Record& each : busy) {
        each.openGate();
        each.waitFor("rc~");
    }
}

TEST_F(Tasks, CancelledWhileRunningStayAliveAndNeverComplete) {
    auto task = boost::make_shared<TestTask>(record);
    task->waits = true;
    manager.addTask(task, 0);
    record.waitFor("r");
    manager.cancelTask(task);
    task.reset();
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    EXPECT_EQ(record.get(), "r");
    record.openGate();
    record.waitFor("~");
    EXPECT_EQ(record.get(), "r~");
}

TEST_F(Tasks, CancellingWhatIsNotThereDoesNothing) {
    manager.cancelTask(boost::shared_ptr<Tasking::Task>());
    const auto task = boost::make_shared<TestTask>(record);
    manager.cancelTask(task);
    manager.addTask(task, 0);
    record.waitFor("c");
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    manager.cancelTask(task);
    EXPECT_EQ(record.get(), "rc");
}

TEST_F(Tasks, MayBeAddedAgainByTheirCompletion) {
    auto task = boost::make_shared<TestTask>(record);
    TestTask* const raw = task.get();
    int rounds = 0;
    task->reaction = [this, raw, &rounds] {
        if (++rounds < 3) {
            manager.addTask(raw->shared_from_this(), 0);
        }
    };
    manager.addTask(task, 0);
    task.reset();
    record.waitFor("~");
    EXPECT_EQ(record.get(), "rcrcrc~");
}

TEST_F(Tasks, MayBeAddedOnceAtATime) {
    const TestSupport::AssertCapture asserts;
    const auto task = boost::make_shared<TestTask>(record);
    task->waits = true;
    manager.addTask(task, 0);
    record.waitFor("r");
    manager.addTask(task, 0);
    EXPECT_EQ(asserts.count(), 1u);
    record.openGate();
    record.waitFor("c");
    EXPECT_EQ(kdDrainEventsKOR(), 0);
    EXPECT_EQ(record.get(), "rc");
}

TEST_F(Tasks, MustExist) {
    const TestSupport::AssertCapture asserts;
    manager.addTask(boost::shared_ptr<Tasking::Task>(), 0);
    EXPECT_EQ(asserts.count(), 1u);
    EXPECT_EQ(asserts.reports().at(0).condition, "task");
}

TEST_F(Tasks, AreCancelledWithTheirManager) {
    auto task = boost::make_shared<TestTask>(record);
    task->waits = true;
    manager.addTask(task, 0);
    record.waitFor("r");
    Util::SingletonStorage::destroyAll();
    task.reset();
    record.openGate();
    record.waitFor("~");
    EXPECT_EQ(record.get(), "r~");
    Record later;
    TaskManager::getInstance().addTask(boost::make_shared<TestTask>(later), 0);
    later.waitFor("~");
    EXPECT_EQ(later.get(), "rc~");
}

class QuietTask : public Tasking::Task {
  public:
    void runTask() override {}
    void onTaskCompleted() override {}
};

TEST(TasksDeathTest, QueuedAtTheEndOfTheProcessDoNoHarm) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            for (int i = 0; i < 100; ++i) {
                TaskManager::getInstance().addTask(boost::make_shared<QuietTask>(), 0);
            }
            std::exit(0);
        },
        ::testing::ExitedWithCode(0), "^$");
}

}  // namespace
