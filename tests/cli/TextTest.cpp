#include "cli/Text.h"

#include <gtest/gtest.h>

#include <limits>

#include "cli/LevelBar.h"

namespace {

TEST(LevelBar, GrowsWithTheLevel) {
    EXPECT_EQ(Cli::levelBar(0, 10), "----------");
    EXPECT_EQ(Cli::levelBar(22.5F, 10), "#####-----");
    EXPECT_EQ(Cli::levelBar(Cli::LEVEL_BAR_MAX_DB, 10), "##########");
}

TEST(LevelBar, StaysWithinItsWidthForAnyLevel) {
    EXPECT_EQ(Cli::levelBar(-30, 4), "----");
    EXPECT_EQ(Cli::levelBar(1000, 4), "####");
    EXPECT_EQ(Cli::levelBar(std::numeric_limits<float>::infinity(), 4), "####");
    EXPECT_EQ(Cli::levelBar(-std::numeric_limits<float>::infinity(), 4), "----");
    EXPECT_EQ(Cli::levelBar(std::numeric_limits<float>::quiet_NaN(), 4), "----");
}

TEST(Text, AlignsNumbers) {
    EXPECT_EQ(Cli::fixed(3.14159, 7, 2), "   3.14");
    EXPECT_EQ(Cli::fixed(-1, 0, 0), "-1");
    EXPECT_EQ(Cli::timeColumn(203), "   203 ms  ");
    EXPECT_EQ(Cli::timeColumn(12345678), "12345678 ms  ");
}

TEST(Text, PadsByCharacters) {
    EXPECT_EQ(Cli::padded("ab", 4), "ab  ");
    EXPECT_EQ(Cli::padded("\xC3\xA9", 3), "\xC3\xA9  ");
    EXPECT_EQ(Cli::padded("abcdef", 4), "abcdef");
    EXPECT_EQ(Cli::characterCount("\xD0\xBF\xD0\xBE"), 2U);
}

TEST(Text, ReplacesControlCharacters) {
    EXPECT_EQ(Cli::printable("a\nb\x1b\x7f\xC2\x9B"
                             "c"),
              "a?b???c");
    EXPECT_EQ(Cli::printable("d\xC3\xA9j\xC3\xA0 \xC2\xAB"), "d\xC3\xA9j\xC3\xA0 \xC2\xAB");
    EXPECT_EQ(Cli::printable("end\xC2"), "end\xC2");
}

}  // namespace
