#include "gateway/RecordLog.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>
#include <sstream>
#include <thread>
#include <vector>

#include "pal/kd.h"
#include "support/LogCapture.h"
#include "support/ScratchDirectory.h"

namespace {

using Gateway::RecordLog;

class RecordLogTest : public ::testing::Test {
  protected:
    // The hand-driven clock counts its calendar from its start.
    RecordLogTest() : path(directory.path("records")) { kdUseManualClockKOR(1772366400000000000); }
    ~RecordLogTest() override { kdUseRealClockKOR(); }

    std::string content() const {
        std::ostringstream text;
        text << std::ifstream(path, std::ios::binary).rdbuf();
        return text.str();
    }

    const TestSupport::ScratchDirectory directory;
    const std::string path;
    RecordLog log;
};

TEST_F(RecordLogTest, AppendsALineWithTheTimeAtOnce) {
    ASSERT_EQ("", log.open(path));
    EXPECT_TRUE(log.append("u1", "time=1;name=a b"));
    kdAdvanceClockKOR(61LL * 1000000000);
    EXPECT_TRUE(log.append("", "r2"));
    EXPECT_EQ(
        "2026-03-01T12:00:00Z uuid=u1 time=1;name=a b\n"
        "2026-03-01T12:01:01Z uuid= r2\n",
        content());
}

TEST_F(RecordLogTest, KeepsEveryByteReadableOnOneLine) {
    ASSERT_EQ("", log.open(path));
    EXPECT_TRUE(log.append("a b\n", std::string("\0\t\r\n\x7F\\x00 \xC3\xA4\xFF", 13)));
    EXPECT_EQ(
        "2026-03-01T12:00:00Z uuid=a\\x20b\\x0a \\x00\\x09\\x0d\\x0a\\x7f\\x5cx00 \xC3\xA4\xFF\n",
        content());
}

TEST_F(RecordLogTest, AppendsToWhatIsThere) {
    std::ofstream(path) << "before\n";
    ASSERT_EQ("", log.open(path));
    EXPECT_TRUE(log.append("u", "r"));
    EXPECT_EQ("before\n2026-03-01T12:00:00Z uuid=u r\n", content());
}

TEST_F(RecordLogTest, SyncsInBatchesAndBeforeItCloses) {
    constexpr int THREADS = 4;
    constexpr int LINES = 250;
    ASSERT_EQ("", log.open(path));
    std::vector<std::thread> threads;
    threads.reserve(THREADS);
    for (int thread = 0; thread < THREADS; ++thread) {
        threads.emplace_back([this] {
            for (int i = 0; i < LINES; ++i) {
                EXPECT_TRUE(log.append("u", std::string(100, 'r')));
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    log.close();
    EXPECT_GE(log.getSyncCount(), 1U);
    EXPECT_LT(log.getSyncCount(), static_cast<std::size_t>(THREADS * LINES));
    const std::string line = "2026-03-01T12:00:00Z uuid=u " + std::string(100, 'r') + "\n";
    std::string all;
    for (int i = 0; i < THREADS * LINES; ++i) {
        all += line;
    }
    EXPECT_TRUE(all == content());
    EXPECT_FALSE(log.append("u", "after the end"));
}

TEST_F(RecordLogTest, SaysWhyAFileCannotBeWritten) {
    EXPECT_EQ("cannot write the log of records " + directory.path("no/file") +
                  ": No such file or directory",
              log.open(directory.path("no/file")));
    const TestSupport::LogCapture messages;
    RecordLog full;
    ASSERT_EQ("", full.open("/dev/full"));
    EXPECT_FALSE(full.append("u", "r"));
    EXPECT_TRUE(messages.contains("cannot write a record: No space left on device"));
    EXPECT_EQ(0U, full.getSyncCount());
}

}  // namespace
