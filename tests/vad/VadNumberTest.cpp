#include "talvox/impl/VadNumber.h"

#include <gmock/gmock.h>

#include <cmath>
#include <limits>

#include "support/CommaLocale.h"
#include "support/LogCapture.h"
#include "talvox/impl/VoiceActivityDetector.h"

namespace {

using Talvox::parseFloatParameter;
using Talvox::parseIntParameter;

const float INFINITE = std::numeric_limits<float>::infinity();

struct FloatText {
    const char* text;
    float value;
};

// What scanf reads with "%f" in the "C" locale.
const FloatText FLOAT_TEXTS[] = {
    {"0.9", 0.9F},
    {"0,9", 0},
    {" 0.25", 0.25F},
    {"\t-1", -1},
    {"+.5", 0.5F},
    {"5.", 5},
    {"1e-2x", 0.01F},
    {"0.5 and more", 0.5F},
    {"0x1.8p1", 3},
    {"1e39", INFINITE},
    {"-1e39", -INFINITE},
    {"inf", INFINITE},
    {"-inf", -INFINITE},
    {" +INFINITY", INFINITE},
    {"1e99 x", INFINITE},
    {"infin", 0},
    {"1e-50", 0},
    {"", 0},
    {" ", 0},
    {"x", 0},
    {".", 0},
    {"-", 0},
    {"- 1", 0},
    {"in", 0},
};

void expectFloatTexts() {
    for (const FloatText& row : FLOAT_TEXTS) {
        EXPECT_EQ(parseFloatParameter(row.text), row.value) << '"' << row.text << '"';
    }
    for (const char* text : {"nan", "-NaN", "nan(1)"}) {
        EXPECT_TRUE(std::isnan(parseFloatParameter(text))) << text;
    }
}

TEST(VadNumber, ReadsNumbersAsScanfDoes) {
    expectFloatTexts();
    EXPECT_EQ(parseIntParameter("20"), 20);
    EXPECT_EQ(parseIntParameter(" -7ms"), -7);
    EXPECT_EQ(parseIntParameter("010"), 10);
    EXPECT_EQ(parseIntParameter("0x10"), 0);
    EXPECT_EQ(parseIntParameter("x"), 0);
    EXPECT_EQ(parseIntParameter(""), 0);
    EXPECT_EQ(parseIntParameter("4294967297"), 1);
}

TEST(VadNumber, ReadsTheSameNumbersInALocaleWithCommas) {
    const TestSupport::CommaLocale german;
    if (!TestSupport::CommaLocale::isAvailable()) {
        GTEST_SKIP() << "the sources of locales are not installed";
    }
    ASSERT_TRUE(german.isSet());
    expectFloatTexts();
}

TEST(VadNumber, TellsWhatTheTextHolds) {
    EXPECT_TRUE(Talvox::readFloatParameter("0.5").isWholeText);
    EXPECT_TRUE(Talvox::readFloatParameter("-infinity").isWholeText);
    EXPECT_TRUE(Talvox::readFloatParameter("nan").isWholeText);
    EXPECT_FALSE(Talvox::readFloatParameter("0,5").isWholeText);
    EXPECT_TRUE(Talvox::readFloatParameter("0,5").isNumber);
    EXPECT_FALSE(Talvox::readFloatParameter("inf x").isWholeText);
    EXPECT_FALSE(Talvox::readFloatParameter("x").isNumber);
    EXPECT_TRUE(Talvox::readIntParameter("20").isWholeText);
    EXPECT_FALSE(Talvox::readIntParameter("20ms").isWholeText);
    EXPECT_TRUE(Talvox::readIntParameter("20ms").isNumber);
    EXPECT_FALSE(Talvox::readIntParameter("ms").isNumber);
}

TEST(VadNumber, DetectorsHaveTheirThresholdsInALocaleWithCommas) {
    const TestSupport::CommaLocale german;
    if (!TestSupport::CommaLocale::isAvailable()) {
        GTEST_SKIP() << "the sources of locales are not installed";
    }
    ASSERT_TRUE(german.isSet());
    const TestSupport::LogCapture log;
    Talvox::VoiceActivityDetector::create("activityon=0.9;activityoff=0.125");
    EXPECT_THAT(log.messages(),
                ::testing::ElementsAre("activityOff 0.125000", "activityOn 0.900000"));
}

}  // namespace
