#include "cli/Interrupts.h"

#include <gtest/gtest.h>

#include <csignal>
#include <future>

namespace {

TEST(Interrupts, CallsOnTheFirstSignalFromAThreadOfItsOwn) {
    std::promise<std::thread::id> caller;
    {
        const Cli::Interrupts interrupts(
            [&caller] { caller.set_value(std::this_thread::get_id()); });
        std::raise(SIGINT);
        EXPECT_NE(caller.get_future().get(), std::this_thread::get_id());
    }
}

TEST(Interrupts, RestoresWhatSignalsDidBefore) {
    const auto before = std::signal(SIGINT, SIG_IGN);
    {
        const Cli::Interrupts interrupts([] { ADD_FAILURE(); });
    }
    std::raise(SIGINT);
    EXPECT_EQ(std::signal(SIGINT, before), SIG_IGN);
}

TEST(Interrupts, WorkAgainAfterwards) {
    for (int round = 0; round < 2; ++round) {
        std::promise<void> called;
        const Cli::Interrupts interrupts([&called] { called.set_value(); });
        std::raise(SIGTERM);
        called.get_future().get();
    }
}

void interruptTwice() {
    const Cli::Interrupts interrupts([] {});
    std::raise(SIGINT);
    std::raise(SIGINT);
}

TEST(InterruptsDeathTest, LeavesAtOnceOnTheSecondSignal) {
    ::testing::FLAGS_gtest_death_test_style = "threadsafe";
    EXPECT_EXIT(interruptTwice(), ::testing::ExitedWithCode(130), "");
}

}  // namespace
