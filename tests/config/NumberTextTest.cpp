#include "util/impl/NumberText.h"

#include <gtest/gtest.h>

#include <cfloat>
#include <cmath>
#include <limits>
#include <locale>
#include <string>

#include "support/CommaLocale.h"

using TestSupport::CommaLocale;
using Util::NumberText;

namespace {

constexpr int INT_LOWEST = std::numeric_limits<int>::min();
constexpr int INT_HIGHEST = std::numeric_limits<int>::max();

struct IntCase {
    std::string text;
    NumberText::Status status;
    int value;
};

struct FloatCase {
    std::string text;
    NumberText::Status status;
    float value;
    std::size_t end;
};

/** Writes and reads numbers with a comma. */
class CommaPunctuation : public std::numpunct<char> {
  protected:
    char do_decimal_point() const override { return ','; }
    char do_thousands_sep() const override { return '.'; }
    std::string do_grouping() const override { return "\3"; }
};

class HostLocale {
  public:
    HostLocale()
        : old(std::locale::global(std::locale(std::locale::classic(), new CommaPunctuation))) {}
    ~HostLocale() { std::locale::global(old); }

  private:
    std::locale old;
};

}  // namespace

TEST(NumberText, ReadsIntegersInThreeBases) {
    const IntCase cases[] = {
        {"16000", NumberText::NUMBER, 16000},
        {"0x3E80", NumberText::NUMBER, 16000},
        {"0X3e80", NumberText::NUMBER, 16000},
        {"037200", NumberText::NUMBER, 16000},
        {"-0x10", NumberText::NUMBER, -16},
        {"+7", NumberText::NUMBER, 7},
        {" \t\r\n\v\f7", NumberText::NUMBER, 7},
        {"7.9", NumberText::NUMBER, 7},
        {"12abc", NumberText::NUMBER, 12},
        {"08", NumberText::NUMBER, 0},
        {"2147483647", NumberText::NUMBER, INT_HIGHEST},
        {"-2147483648", NumberText::NUMBER, INT_LOWEST},
    };
    for (const IntCase& each : cases) {
        const auto reading = NumberText::readInt(each.text);
        EXPECT_EQ(each.status, reading.status) << each.text;
        EXPECT_EQ(each.value, reading.value) << each.text;
    }
}

TEST(NumberText, BringsIntegersBeyondTheRangeToItsEnds) {
    const IntCase cases[] = {
        {"2147483648", NumberText::OUT_OF_RANGE, INT_HIGHEST},
        {"-2147483649", NumberText::OUT_OF_RANGE, INT_LOWEST},
        {"0xFFFFFFFF", NumberText::OUT_OF_RANGE, INT_HIGHEST},
        {"99999999999999999999999999", NumberText::OUT_OF_RANGE, INT_HIGHEST},
        {"-99999999999999999999999999", NumberText::OUT_OF_RANGE, INT_LOWEST},
    };
    for (const IntCase& each : cases) {
        const auto reading = NumberText::readInt(each.text);
        EXPECT_EQ(each.status, reading.status) << each.text;
        EXPECT_EQ(each.value, reading.value) << each.text;
    }
}

TEST(NumberText, TellsWhatIsNoInteger) {
    for (const char* text : {"", " ", "abc", "-", "+", "- 7", ".5", "nan", "true"}) {
        const auto reading = NumberText::readInt(text);
        EXPECT_EQ(NumberText::NOT_A_NUMBER, reading.status) << text;
        EXPECT_EQ(0, reading.value) << text;
    }
}

TEST(NumberText, ReadsFloatsInBothForms) {
    const FloatCase cases[] = {
        {"0.9", NumberText::NUMBER, 0.9F, 3},
        {"-.5e1", NumberText::NUMBER, -5.0F, 5},
        {"5.", NumberText::NUMBER, 5.0F, 2},
        {"+5", NumberText::NUMBER, 5.0F, 2},
        {" \n\t0.25x", NumberText::NUMBER, 0.25F, 7},
        {"1,5", NumberText::NUMBER, 1.0F, 1},
        {"1.5.5", NumberText::NUMBER, 1.5F, 3},
        {"1e5x", NumberText::NUMBER, 1e5F, 3},
        {"1E-2", NumberText::NUMBER, 0.01F, 4},
        {"1e", NumberText::NUMBER, 1.0F, 1},
        {"1e+x", NumberText::NUMBER, 1.0F, 1},
        {"0x10", NumberText::NUMBER, 16.0F, 4},
        {"0x1.8p1", NumberText::NUMBER, 3.0F, 7},
        {"0x.8", NumberText::NUMBER, 0.5F, 4},
        {"0x10p-4", NumberText::NUMBER, 1.0F, 7},
        {"-0X1P+3", NumberText::NUMBER, -8.0F, 7},
        {"0xg", NumberText::NUMBER, 0.0F, 1},
        {"16777217", NumberText::NUMBER, 16777216.0F, 8},
        {"3.40282346e38", NumberText::NUMBER, FLT_MAX, 13},
        {"1e-999999999999", NumberText::NUMBER, 0.0F, 15},
        {"0e999999999999", NumberText::NUMBER, 0.0F, 14},
        {"0x1p-999999999999", NumberText::NUMBER, 0.0F, 17},
    };
    for (const FloatCase& each : cases) {
        const auto reading = NumberText::readFloat(each.text);
        EXPECT_EQ(each.status, reading.status) << each.text;
        EXPECT_EQ(each.value, reading.value) << each.text;
        EXPECT_EQ(each.end, reading.end) << each.text;
    }
}

TEST(NumberText, BringsFloatsBeyondTheRangeToItsEnds) {
    for (const std::string& text :
         {std::string("1e39"), std::string("3.5e38"), std::string("1e999999999999"),
          std::string("0x1p128"), std::string("0x1p999999999999"), std::string(5000, '9')}) {
        const auto positive = NumberText::readFloat(text);
        EXPECT_EQ(NumberText::OUT_OF_RANGE, positive.status) << text;
        EXPECT_EQ(FLT_MAX, positive.value) << text;
        EXPECT_EQ(text.size(), positive.end) << text;
        EXPECT_EQ(-FLT_MAX, NumberText::readFloat("-" + text).value) << text;
    }
}

TEST(NumberText, TakesInfinityForANumberBeyondTheRange) {
    for (const std::string text : {"inf", "INF", "Infinity", "iNFiNiTY"}) {
        const auto positive = NumberText::readFloat(text);
        EXPECT_EQ(NumberText::OUT_OF_RANGE, positive.status) << text;
        EXPECT_EQ(FLT_MAX, positive.value) << text;
        EXPECT_EQ(text.size(), positive.end) << text;
        EXPECT_EQ(FLT_MAX, NumberText::readFloat(" +" + text).value) << text;
        const auto negative = NumberText::readFloat("-" + text + ",5");
        EXPECT_EQ(NumberText::OUT_OF_RANGE, negative.status) << text;
        EXPECT_EQ(-FLT_MAX, negative.value) << text;
        EXPECT_EQ(text.size() + 1, negative.end) << text;
    }
}

TEST(NumberText, TellsWhatIsNoFloat) {
    for (const char* text :
         {"",     " ",    "abc",  "-",      ".",   "-.",      ".e5",      "e5",
          "nan",  "NAN",  "-nan", "nan(1)", "in",  "infinit", "infinite", "infinityx",
          "inf1", "inf_", "infZ", "- inf",  "- 1", "--1"}) {
        const auto reading = NumberText::readFloat(text);
        EXPECT_EQ(NumberText::NOT_A_NUMBER, reading.status) << text;
        EXPECT_EQ(0.0F, reading.value) << text;
    }
}

TEST(NumberText, ReadsFromTheMiddleOfAText) {
    const auto reading = NumberText::readFloat("1.5, 2.5", 4);
    EXPECT_EQ(NumberText::NUMBER, reading.status);
    EXPECT_EQ(2.5F, reading.value);
    EXPECT_EQ(8U, reading.end);
    EXPECT_EQ(NumberText::NOT_A_NUMBER, NumberText::readFloat("1", 1).status);
}

TEST(NumberText, WritesSixSignificantDigits) {
    EXPECT_EQ("0.9", NumberText::writeFloat(0.9F));
    EXPECT_EQ("0", NumberText::writeFloat(0.0F));
    EXPECT_EQ("-2", NumberText::writeFloat(-2.0F));
    EXPECT_EQ("55.7522", NumberText::writeFloat(55.75222F));
    EXPECT_EQ("1e+06", NumberText::writeFloat(1000000.0F));
    EXPECT_EQ("1.5e-05", NumberText::writeFloat(0.000015F));
}

TEST(NumberText, AHostApplicationsLocaleChangesNothing) {
    const HostLocale comma;
    EXPECT_EQ(0.9F, NumberText::readFloat("0.9").value);
    EXPECT_EQ(3U, NumberText::readFloat("0.9").end);
    EXPECT_EQ("0.9", NumberText::writeFloat(0.9F));
    EXPECT_EQ("12345.5", NumberText::writeFloat(12345.5F));
}

TEST(NumberText, AHostApplicationsCLocaleChangesNothing) {
    if (!CommaLocale::isAvailable()) {
        GTEST_SKIP() << "no locale with a decimal comma can be made on this machine";
    }
    const CommaLocale comma;
    ASSERT_TRUE(comma.isSet());
    EXPECT_EQ(0.9F, NumberText::readFloat("0.9").value);
    EXPECT_EQ("0.9", NumberText::writeFloat(0.9F));
}
