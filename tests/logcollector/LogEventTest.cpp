#include "logcollector/LogEvent.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "pal/kd.h"
#include "support/LogCapture.h"

using LogCollector::LogEvent;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

namespace {

class LogEventTest : public ::testing::Test {
  protected:
    LogEventTest() { kdUseManualClockKOR(1234); }
    ~LogEventTest() override { kdUseRealClockKOR(); }

    static std::vector<std::string> paramsOf(const LogEvent& event) {
        std::vector<std::string> texts;
        for (auto it = event.getParamsIterator(); it != event.getParamsEndIterator(); ++it) {
            texts.push_back(it->first + "=" + it->second);
        }
        return texts;
    }

    TestSupport::LogCapture log;
};

TEST_F(LogEventTest, HasTheTimeOfItsMaking) {
    const LogEvent event(LogEvent::error, "name");
    kdAdvanceClockKOR(10);
    EXPECT_EQ(1234, event.getTimestamp());
    EXPECT_EQ(1244, LogEvent(LogEvent::event, "").getTimestamp());
    EXPECT_EQ(LogEvent::error, event.getType());
    EXPECT_EQ("name", event.getName());
    EXPECT_EQ(0U, event.getParamsCount());
}

TEST_F(LogEventTest, NumbersAndWordsOfTheTypesAreFixed) {
    EXPECT_EQ(0, LogEvent::event);
    EXPECT_EQ(1, LogEvent::error);
    EXPECT_EQ("event", LogEvent::eventTypesDescriptions[LogEvent::event]);
    EXPECT_EQ("error", LogEvent::eventTypesDescriptions[LogEvent::error]);
}

TEST_F(LogEventTest, CopiesItsParameters) {
    LogEvent::Params params{{"b", "1"}};
    const LogEvent event(LogEvent::event, "name", params);
    params["b"] = "2";
    EXPECT_THAT(paramsOf(event), ElementsAre("b=1"));
}

TEST_F(LogEventTest, OrdersParametersByTheirBytes) {
    LogEvent event(LogEvent::event, "name");
    event.addParam("\xC3\xA4", "4");
    event.addParam("a", "3");
    event.addParam("Z", "2");
    event.addParam(std::string("\0", 1), "1");
    EXPECT_THAT(paramsOf(event), ElementsAre(std::string("\0=1", 3), "Z=2", "a=3", "\xC3\xA4=4"));
    EXPECT_EQ(4U, event.getParamsCount());
}

TEST_F(LogEventTest, TellsWhenAParameterIsReplaced) {
    LogEvent event(LogEvent::event, "name", {{"key", "old"}});
    EXPECT_THAT(log.messages(), IsEmpty());
    event.addParam("key", "new");
    EXPECT_THAT(paramsOf(event), ElementsAre("key=new"));
    EXPECT_THAT(log.messages(), ElementsAre("LogEvent: parameter keywill be overwrited"));
}

TEST_F(LogEventTest, MadeFromAStreamIsEmptyAndReadsNothing) {
    std::istringstream stream("type=error;name=x");
    const LogEvent event(stream);
    EXPECT_EQ(0, stream.tellg());
    EXPECT_EQ(LogEvent::event, event.getType());
    EXPECT_EQ("", event.getName());
    EXPECT_EQ(0, event.getTimestamp());
    EXPECT_EQ(0U, event.getParamsCount());
}

}  // namespace
