#include "pal/SignalsBlocked.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <csignal>
#include <thread>

#include "pal/kd_event.h"

namespace {

using korvel_pal::SignalsBlocked;

bool isBlocked(int signal) {
    sigset_t mask;
    sigemptyset(&mask);
    pthread_sigmask(SIG_SETMASK, nullptr, &mask);
    return sigismember(&mask, signal) == 1;
}

bool isBlockedInNewThread(int signal) {
    bool blocked = false;
    std::thread([&] { blocked = isBlocked(signal); }).join();
    return blocked;
}

}  // namespace

TEST(SignalsBlocked, KeepsSignalsFromThreadsThatAreStartedMeanwhile) {
    for (const int signal : {SIGINT, SIGTERM, SIGUSR1, SIGCHLD}) {
        EXPECT_FALSE(isBlockedInNewThread(signal)) << signal;
        const SignalsBlocked blocked;
        EXPECT_TRUE(isBlockedInNewThread(signal)) << signal;
    }
}

TEST(SignalsBlocked, LeavesFaultsToACrashReporter) {
    const SignalsBlocked blocked;
    for (const int signal : {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT, SIGTRAP, SIGSYS}) {
        EXPECT_FALSE(isBlockedInNewThread(signal)) << signal;
    }
}

TEST(SignalsBlocked, KeepsAFaultBlockedThatTheCallerBlocks) {
    sigset_t fault;
    sigset_t before;
    sigemptyset(&fault);
    sigaddset(&fault, SIGBUS);
    pthread_sigmask(SIG_BLOCK, &fault, &before);
    {
        const SignalsBlocked blocked;
        EXPECT_TRUE(isBlocked(SIGBUS));
    }
    EXPECT_TRUE(isBlocked(SIGBUS));
    pthread_sigmask(SIG_SETMASK, &before, nullptr);
}

// The handler of an application's crash reporter runs on the thread that faults.
TEST(SignalsBlockedDeathTest, CrashReporterSeesAFaultOnTheEventThread) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            std::signal(SIGSEGV, [](int) { _exit(17); });
            kdPostKOR([](void*) { std::raise(SIGSEGV); }, nullptr);
            kdDrainEventsKOR();
        },
        testing::ExitedWithCode(17), "");
}

TEST(SignalsBlocked, LeavesTheCallersOwnChoiceAsItWas) {
    sigset_t user;
    sigset_t before;
    sigemptyset(&user);
    sigaddset(&user, SIGUSR2);
    pthread_sigmask(SIG_BLOCK, &user, &before);
    { const SignalsBlocked blocked; }
    EXPECT_TRUE(isBlocked(SIGUSR2));
    EXPECT_FALSE(isBlocked(SIGUSR1));
    pthread_sigmask(SIG_SETMASK, &before, nullptr);
    EXPECT_FALSE(isBlocked(SIGUSR2));
}
