#include "core/Logger.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include "support/LogCapture.h"

namespace {

using ::testing::ElementsAre;

class LoggerTest : public ::testing::Test {
  protected:
    ~LoggerTest() override { Logger::setLevel(Logger::LEVEL_DFLT); }

    TestSupport::LogCapture log;
};

TEST_F(LoggerTest, TellsProblemsAndNoProgressAtFirst) {
    EXPECT_EQ(1, Logger::getLevel());
    Logger::log(Logger::PROBLEM, "problem %d", 1);
    Logger::log(Logger::PROGRESS, "step %d", 2);
    EXPECT_THAT(log.messages(), ElementsAre("problem 1"));
}

TEST_F(LoggerTest, WritesWhatIsNotAboveTheLevel) {
    Logger::setLevel(Logger::PROGRESS);
    Logger::log(2, "written");
    Logger::log(3, "not written");
    Logger::setLevel(Logger::SILENT);
    Logger::log(1, "not written");
    EXPECT_THAT(log.messages(), ElementsAre("written"));
}

TEST_F(LoggerTest, WritesMessagesOfAnyLength) {
    const std::string text(100000, 'x');
    Logger::log(Logger::PROBLEM, "%s!", text.c_str());
    EXPECT_THAT(log.messages(), ElementsAre(text + "!"));
}

}  // namespace
