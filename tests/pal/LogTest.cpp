#include <gmock/gmock.h>

#include <algorithm>
#include <cstdio>
#include <string>
#include <thread>
#include <vector>

#include "pal/kd_log.h"
#include "support/CommaLocale.h"
#include "support/LogCapture.h"

using ::testing::ElementsAre;
using TestSupport::LogCapture;

namespace {

// No character of any encoding.
const wchar_t NO_TEXT[] = {static_cast<wchar_t>(0x7fffffff), 0};

TEST(Log, HandsMessagesToTheSink) {
    const LogCapture log;
    kdLogMessage("as it is: %s %n");
    kdLogFormatMessage("%s %d", "seven", 7);
    EXPECT_THAT(log.messages(), ElementsAre("as it is: %s %n", "seven 7"));
}

TEST(Log, TakesNullAsEmpty) {
    const LogCapture log;
    kdLogMessage(nullptr);
    EXPECT_THAT(log.messages(), ElementsAre(""));
}

TEST(Log, FormatsAnyLength) {
    for (const std::size_t length : {510u, 511u, 512u, 513u, 5000000u}) {
        const LogCapture log;
        const std::string message(length, 'x');
        kdLogFormatMessage("%s", message.c_str());
        EXPECT_EQ(log.count(message), 1u) << length;
    }
}

TEST(Log, PassesAnyBytes) {
    std::string bytes;
    for (int byte = 1; byte < 256; ++byte) {
        bytes += static_cast<char>(byte);
    }
    const LogCapture log;
    kdLogMessage(bytes.c_str());
    kdLogFormatMessage("%s", bytes.c_str());
    EXPECT_EQ(log.count(bytes), 2u);
}

TEST(Log, ShowsTheFormatWhenTheTextCannotBeMade) {
    const LogCapture log;
    kdLogFormatMessage("wide %ls", NO_TEXT);
    EXPECT_THAT(log.messages(), ElementsAre("wide %ls"));
}

TEST(Log, CallsTheSinkOneMessageAtATime) {
    struct Sink {
        int inside = 0;
        int most = 0;
        int count = 0;
    } sink;
    kdSetLogSinkKOR(
        [](const char*, void* user) {
            auto& self = *static_cast<Sink*>(user);
            self.most = std::max(self.most, ++self.inside);
            ++self.count;
            --self.inside;
        },
        &sink);
    std::vector<std::thread> threads;
    threads.reserve(4);
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([] {
            for (int j = 0; j < 200; ++j) {
                kdLogFormatMessage("%d", j);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    kdSetLogSinkKOR(nullptr, nullptr);
    EXPECT_EQ(sink.count, 800);
    EXPECT_EQ(sink.most, 1);
}

int sinkCalls;

TEST(Log, SinkThatLogsReachesStandardErrorInstead) {
    sinkCalls = 0;
    ::testing::internal::CaptureStderr();
    kdSetLogSinkKOR(
        [](const char*, void*) {
            ++sinkCalls;
            kdLogMessage("from inside");
        },
        nullptr);
    kdLogMessage("outside");
    kdSetLogSinkKOR(nullptr, nullptr);
    EXPECT_EQ(::testing::internal::GetCapturedStderr(), "from inside\n");
    EXPECT_EQ(sinkCalls, 1);
}

TEST(Log, SinkMayReplaceItself) {
    ::testing::internal::CaptureStderr();
    kdSetLogSinkKOR([](const char*, void*) { kdSetLogSinkKOR(nullptr, nullptr); }, nullptr);
    kdLogMessage("first");
    kdLogMessage("second");
    EXPECT_EQ(::testing::internal::GetCapturedStderr(), "second\n");
}

TEST(Log, GoesToStandardErrorByDefault) {
    ::testing::internal::CaptureStderr();
    kdLogMessage("a line");
    EXPECT_EQ(::testing::internal::GetCapturedStderr(), "a line\n");
}

TEST(Log, NumbersHaveAPointInALocaleWithCommas) {
    const TestSupport::CommaLocale german;
    if (!TestSupport::CommaLocale::isAvailable()) {
        GTEST_SKIP() << "the sources of locales are not installed";
    }
    ASSERT_TRUE(german.isSet());
    const TestSupport::LogCapture log;
    kdLogFormatMessage("%f", 0.5);
    EXPECT_TRUE(log.contains("0.500000"));
    char buffer[8];
    EXPECT_EQ(kdSprintf_s(buffer, sizeof buffer, "%.1f", 2.5), 3);
    EXPECT_STREQ(buffer, "2.5");
    // The application's own texts keep their form.
    std::snprintf(buffer, sizeof buffer, "%.1f", 2.5);
    EXPECT_STREQ(buffer, "2,5");
}

TEST(Sprintf, WritesWhatFitsAndReportsIt) {
    char buffer[8];
    EXPECT_EQ(kdSprintf_s(buffer, sizeof buffer, "%s", "1234567"), 7);
    EXPECT_STREQ(buffer, "1234567");
    EXPECT_EQ(kdSprintf_s(buffer, sizeof buffer, "%s", "12345678"), 7);
    EXPECT_STREQ(buffer, "1234567");
    EXPECT_EQ(kdSprintf_s(buffer, 1, "%d", 42), 0);
    EXPECT_STREQ(buffer, "");
}

TEST(Sprintf, RefusesNoBuffer) {
    char buffer[4] = "abc";
    EXPECT_EQ(kdSprintf_s(nullptr, 4, "x"), -1);
    EXPECT_EQ(kdSprintf_s(buffer, 0, "x"), -1);
    EXPECT_STREQ(buffer, "abc");
    EXPECT_EQ(kdSprintf_s(buffer, 4, "%ls", NO_TEXT), -1);
    EXPECT_STREQ(buffer, "");
}

}  // namespace
