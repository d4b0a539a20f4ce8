// Threads that the system does not give: the event thread, its first worker, and the further
// workers. Each case has a process of its own, since the event thread starts once.
#include <dirent.h>
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <pthread.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>

#include "pal/kd.h"
#include "support/AssertCapture.h"

namespace {

enum class Threads { ALL, EVERY_OTHER, NONE };

std::atomic<Threads> available{Threads::ALL};
std::atomic<bool> isNextGiven{true};

}  // namespace

// Stands in front of the system's.
extern "C" __attribute__((visibility("default"))) int pthread_create(pthread_t* thread,
                                                                     const pthread_attr_t* how,
                                                                     void* (*run)(void*),
                                                                     void* user) noexcept {
    if (available == Threads::NONE ||
        (available == Threads::EVERY_OTHER && !isNextGiven.exchange(!isNextGiven))) {
        return EAGAIN;
    }
    using Create = int (*)(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*);
    static const auto real = reinterpret_cast<Create>(::dlsym(RTLD_NEXT, "pthread_create"));
    return real(thread, how, run, user);
}

namespace {

using ::testing::ExitedWithCode;
using TestSupport::AssertCapture;

std::size_t countEntries(const char* directory) {
    std::size_t count = 0;
    DIR* const open = ::opendir(directory);
    while (::readdir(open) != nullptr) {
        ++count;
    }
    ::closedir(open);
    return count;
}

/** Threads and descriptors of this process. */
std::string countAll() {
    return std::to_string(countEntries("/proc/self/task")) + " and " +
           std::to_string(countEntries("/proc/self/fd"));
}

/** Returns when a thread has come and gone, also from the list of this process's threads. */
void runOneThread() {
    std::string entry;
    std::thread([&entry] { entry = "/proc/self/task/" + std::to_string(::gettid()); }).join();
    while (::access(entry.c_str(), F_OK) == 0) {
        std::this_thread::yield();
    }
}

/** A thread that was joined may be listed for a moment longer. */
bool isBackTo(const std::string& before) {
    for (int tries = 0; tries < 10000 && countAll() != before; ++tries) {
        std::this_thread::yield();
    }
    return countAll() == before;
}

void addOne(void* count) {
    ++*static_cast<int*>(count);
}

/** What each way into the event thread says. */
std::string callEverything(int& runs) {
    const auto nothing = [](void*) {};
    KDTimer* const timer = kdSetTimer(1, KD_TIMER_ONESHOT, nullptr);
    KDWork* const work = kdQueueWorkKOR(nothing, nullptr, nullptr);
    std::string result =
        std::to_string(kdStartEventsKOR()) + ' ' + std::to_string(kdPostKOR(&addOne, &runs)) +
        (timer != nullptr ? " timer" : " none") + (work != nullptr ? " work" : " none");
    kdCancelTimer(timer);
    return result;
}

[[noreturn]] void startWithFewThreads(Threads few) {
    const AssertCapture asserts;
    int runs = 0;
    kdSetLogSinkKOR([](const char*, void*) {}, nullptr);
    runOneThread();  // a sanitizer makes a thread of its own with the first one
    const std::string before = countAll();
    available = few;
    const std::string scarce = callEverything(runs);
    const bool nothingLeft = isBackTo(before);
    available = Threads::ALL;
    const std::string plenty = callEverything(runs);
    kdDrainEventsKOR();
    std::fprintf(stderr, "%s, nothing left %d; %s, %d ran, %zu asserted", scarce.c_str(),
                 nothingLeft ? 1 : 0, plenty.c_str(), runs, asserts.count());
    std::_Exit(0);
}

const char* const REFUSED_THEN_RIGHT =
    "^-1 -1 none none, nothing left 1; 0 0 timer work, 1 ran, 0 asserted$";

TEST(EventThreadStartDeathTest, WithoutAnyThreadEachCallSaysSoAndTheNextOneTriesAgain) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(startWithFewThreads(Threads::NONE), ExitedWithCode(0), REFUSED_THEN_RIGHT);
}

TEST(EventThreadStartDeathTest, WithoutAThreadBesideTheWorkerLeavesNoWorkerBehind) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    // Each of the four calls gets its worker, but no event thread.
    EXPECT_EXIT(startWithFewThreads(Threads::EVERY_OTHER), ExitedWithCode(0), REFUSED_THEN_RIGHT);
}

[[noreturn]] void workOnOneWorker() {
    kdStartEventsKOR();
    available = Threads::NONE;
    kdSetLogSinkKOR([](const char*, void*) {}, nullptr);
    static std::atomic<int> done{0};
    for (int i = 0; i < 20; ++i) {
        kdQueueWorkKOR([](void*) {}, [](void*) { ++done; }, nullptr);
    }
    while (done < 20) {
        kdDrainEventsKOR();
    }
    std::fprintf(stderr, "%d done", done.load());
    std::_Exit(0);
}

TEST(EventThreadStartDeathTest, WithoutFurtherWorkersTheFirstOneDoesAllWork) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(workOnOneWorker(), ExitedWithCode(0), "^20 done$");
}

[[noreturn]] void failToStartOften() {
    kdSetLogSinkKOR([](const char*, void*) {}, nullptr);
    available = Threads::NONE;
    const std::string before = countAll();
    int failures = 0;
    for (int i = 0; i < 1000; ++i) {
        failures -= kdPostKOR(&addOne, nullptr);
    }
    std::fprintf(stderr, "%d failed, nothing left %d", failures, isBackTo(before) ? 1 : 0);
    std::_Exit(0);
}

TEST(EventThreadStartDeathTest, AThousandTimesInVainLeavesNothingBehind) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(failToStartOften(), ExitedWithCode(0), "^1000 failed, nothing left 1$");
}

}  // namespace
