#include "cli/Progress.h"

#include <gtest/gtest.h>

#include <sstream>

#include "pal/kd.h"

namespace {

const int64_t NS_PER_MS = 1000000;

class ProgressTest : public ::testing::Test {
  protected:
    ProgressTest() { kdUseManualClockKOR(0); }
    ~ProgressTest() override { kdUseRealClockKOR(); }

    static void pass(int64_t ms) { kdAdvanceClockKOR(ms * NS_PER_MS); }

    std::ostringstream out;
};

TEST_F(ProgressTest, ShowsShareAndTimeLeftOfWorkThatTakesLong) {
    {
        Cli::Progress progress(out, true);
        pass(999);
        progress.show(0.1);
        EXPECT_EQ(out.str(), "");
        pass(1);
        progress.show(0.1);
        EXPECT_EQ(out.str(), "\r\x1b[K[###---------------------------]  10 %, 9 s left");
        out.str("");
        pass(199);
        progress.show(0.2);
        EXPECT_EQ(out.str(), "");
        pass(801);
        // A thread that reports late does not move the bar back.
        progress.show(0.5);
        out.str("");
        pass(200);
        progress.show(0.4);
        EXPECT_EQ(out.str(), "\r\x1b[K[###############---------------]  50 %, 3 s left");
        out.str("");
        pass(600000);
        progress.show(0.5);
        EXPECT_EQ(out.str(), "\r\x1b[K[###############---------------]  50 %, 11 min left");
        out.str("");
    }
    EXPECT_EQ(out.str(), "\r\x1b[K");
}

TEST_F(ProgressTest, WritesNothingToAFileOrForShortWork) {
    {
        Cli::Progress file(out, false);
        Cli::Progress quick(out, true);
        quick.show(1);
        pass(5000);
        file.show(0.5);
    }
    EXPECT_EQ(out.str(), "");
}

}  // namespace
