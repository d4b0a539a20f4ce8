// Usage events with the installed headers and libraries only.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "core/Logger.h"
#include "logcollector/LogCollector.h"
#include "pal/kd.h"

namespace {

using ::testing::ElementsAre;

class UsageEvents : public ::testing::Test {
  protected:
    UsageEvents() {
        kdUseManualClockKOR(0);
        kdSetLogSinkKOR(
            [](const char* message, void* user) {
                static_cast<std::vector<std::string>*>(user)->emplace_back(message);
            },
            &messages);
    }
    ~UsageEvents() override {
        kdDrainEventsKOR();
        kdSetLogSinkKOR(nullptr, nullptr);
        kdUseRealClockKOR();
    }

    std::vector<std::string> messages;
};

TEST_F(UsageEvents, WaitForAnEndpointThatCanBeAsked) {
    LogCollector::configure("0123456789abcdef0123456789abcdef", "no address");
    LogCollector::setLoggingEnabled(true);
    LogCollector::startSession("main");
    LogCollector::logEvent("main", "screenOpened", {{"screen", "settings"}});
    LogCollector::stopSession("main");
    EXPECT_EQ(2U, LogCollector::getPendingCount());
    LogCollector::logEvent("main", "too late", {});
    EXPECT_EQ(2U, LogCollector::LogCollector::getInstance().getPendingCount());
    LogCollector::setLoggingEnabled(false);
    EXPECT_FALSE(LogCollector::isLoggingEnabled());
    EXPECT_EQ("no address", LogCollector::getUrl());
}

TEST_F(UsageEvents, AreNotStoredWhereThereIsNoFolder) {
    LogCollector::LogStoreOptions options;
    EXPECT_EQ(4 << 20, options.maxBytes);
    EXPECT_EQ(int64_t{30} * 24 * 60 * 60, options.maxAgeS);
    options.folder = "/dev/null";
    EXPECT_FALSE(LogCollector::openStore(options));
    EXPECT_THAT(messages,
                ElementsAre("LogStore: /dev/null is not used, records are in memory only: "
                            "Not a directory"));
}

TEST_F(UsageEvents, AreLoggedAtALevelThatTheApplicationSets) {
    LogCollector::LogEvent event(LogCollector::LogEvent::error, "lost", {{"code", "7"}});
    event.addParam("code", "8");
    Logger::setLevel(Logger::SILENT);
    event.addParam("code", "9");
    Logger::setLevel(Logger::LEVEL_DFLT);
    EXPECT_THAT(messages, ElementsAre("LogEvent: parameter codewill be overwrited"));
    EXPECT_EQ("9", event.getParamsIterator()->second);
}

}  // namespace
