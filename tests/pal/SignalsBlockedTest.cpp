#include "pal/SignalsBlocked.h"

#include <gtest/gtest.h>

#include <thread>

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
