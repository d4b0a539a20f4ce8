// A usage log for which memory runs short: no exception reaches the application, and what the log
// does not say is lost arrives.
#include <atomic>
#include <cstring>

#include "LogFixture.h"
#include "support/AllocationFault.h"
#include "support/Threads.h"

namespace {

using TestSupport::AllocationFault;

class LogScarcityTest : public LogFixture {
  protected:
    // Takes no memory, other than a capture of the log.
    LogScarcityTest() { kdSetLogSinkKOR(&LogScarcityTest::count, this); }

    void failEachAllocationOfACall(AllocationFault::Extent extent) {
        LogCollector::startSession("s");
        std::size_t calls = 0;
        bool failed = true;
        while (failed) {
            {
                const AllocationFault fault(static_cast<int>(++calls), extent);
                LogCollector::logEvent("s", "something", {});
                failed = AllocationFault::hasHappened();
            }
            // What could not be sent goes first. Then nothing is under way: the next call sends.
            LogCollector::logEvent("s", "next", {});
            ASSERT_TRUE(
                TestSupport::waitForThreads([] { return LogCollector::getPendingCount() == 0; }));
        }
        EXPECT_GT(calls, 5U);
        EXPECT_GT(lost, 0U);
        EXPECT_EQ(server.getRequestCount() + lost, 2 * calls);
    }

  private:
    static void count(const char* message, void* self) {
        const char* const text = "LogCollector::logEvent: nothing is recorded: std::bad_alloc";
        static_cast<LogScarcityTest*>(self)->lost += std::strcmp(message, text) == 0 ? 1 : 0;
    }

    std::atomic<std::size_t> lost{0};
};

}  // namespace

TEST_F(LogScarcityTest, EachAllocationOfACallMayFail) {
    failEachAllocationOfACall(AllocationFault::ONE);
}

TEST_F(LogScarcityTest, AllAllocationsOfACallMayFailFromAnyOn) {
    failEachAllocationOfACall(AllocationFault::ALL_FROM_THERE_ON);
}
