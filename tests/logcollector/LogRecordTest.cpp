#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <cstdint>
#include <limits>
#include <string>

#include "logcollector/LogEvent.h"
#include "logcollector/impl/LogSender.h"
#include "pal/kd.h"

using LogCollector::LogEvent;
using LogCollector::LogSender;
using LogCollector::timeToString;

namespace {

class LogRecordTest : public ::testing::Test {
  protected:
    LogRecordTest() { kdUseManualClockKOR(0); }
    ~LogRecordTest() override { kdUseRealClockKOR(); }

    static std::string record(LogEvent::EventType type, const std::string& name,
                              const LogEvent::Params& params, const std::string& sessionId) {
        return LogSender::toString(boost::make_shared<LogEvent>(type, name, params), sessionId);
    }
};

TEST_F(LogRecordTest, PrintsTheYearFrom1900AndTheMonthFromZero) {
    EXPECT_EQ("70-00-01 00:00:00", timeToString(0));
    EXPECT_EQ("100-01-29 12:34:56", timeToString(951827696));
    EXPECT_EQ("99-11-31 23:59:59", timeToString(946684799));
    EXPECT_EQ("124-00-01 00:00:00", timeToString(1704067200));
}

TEST_F(LogRecordTest, PrintsTimesBefore1970And1900) {
    EXPECT_EQ("69-11-31 23:59:59", timeToString(-1));
    EXPECT_EQ("0-00-01 00:00:00", timeToString(-2208988800));
    EXPECT_EQ("-1-11-31 23:59:59", timeToString(-2208988801));
}

TEST_F(LogRecordTest, PrintsThePlatformClockAsIfItCountedSeconds) {
    // An hour after the clock's start, in nanoseconds.
    EXPECT_EQ("114149-05-16 16:00:00", timeToString(3600LL * 1000000000));
    kdAdvanceClockKOR(3600LL * 1000000000);
    EXPECT_EQ("time=114149-05-16 16:00:00;sessionId=s;type=event;name=n",
              record(LogEvent::event, "n", {}, "s"));
}

TEST_F(LogRecordTest, PrintsTimesThatNoYearHolds) {
    EXPECT_EQ("2147483647-11-31 23:59:59", timeToString(std::numeric_limits<int64_t>::max()));
    EXPECT_EQ("-2147483648-00-01 00:00:00", timeToString(std::numeric_limits<int64_t>::min()));
}

TEST_F(LogRecordTest, JoinsItsPartsInOrder) {
    EXPECT_EQ("time=70-00-01 00:00:00;sessionId=main;type=error;name=lost;code=7;where=net",
              record(LogEvent::error, "lost", {{"where", "net"}, {"code", "7"}}, "main"));
}

TEST_F(LogRecordTest, EndsWithTheNameWithoutParameters) {
    EXPECT_EQ("time=70-00-01 00:00:00;sessionId=;type=event;name=",
              record(LogEvent::event, "", {}, ""));
    EXPECT_EQ("time=70-00-01 00:00:00;sessionId=s;type=event;name=open",
              record(LogEvent::event, "open", {}, "s"));
}

TEST_F(LogRecordTest, EscapesNothing) {
    const std::string zero(1, '\0');
    EXPECT_EQ(
        "time=70-00-01 00:00:00;sessionId=a;b;type=event;name=c=d;" + zero + "=\n\r%20;e;=f=\xFF&",
        record(LogEvent::event, "c=d", {{zero, "\n\r%20"}, {"e;", "f=\xFF&"}}, "a;b"));
}

TEST_F(LogRecordTest, TakesTheTimeOfTheEventAndNotOfTheSending) {
    const auto event = boost::make_shared<LogEvent>(LogEvent::event, "n");
    kdAdvanceClockKOR(100);
    EXPECT_EQ("time=70-00-01 00:00:00;sessionId=s;type=event;name=n",
              LogSender::toString(event, "s"));
}

}  // namespace
