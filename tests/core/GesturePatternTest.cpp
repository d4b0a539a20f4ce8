#include "core/sensor/GesturePattern.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using Sensor::GesturePattern;
using testing::HasSubstr;

GesturePattern parse(const std::string& text) {
    std::string error;
    const std::optional<GesturePattern> pattern = GesturePattern::parse(text, error);
    EXPECT_TRUE(pattern) << error;
    return pattern.value_or(GesturePattern());
}

std::string parseBad(const std::string& text) {
    std::string error;
    EXPECT_FALSE(GesturePattern::parse(text, error)) << text;
    return error;
}

TEST(GesturePattern, ReadsSpansBetweenBlanks) {
    EXPECT_EQ(parse("near:50-500").getSpanCount(), 1U);
    EXPECT_EQ(parse("  near:50-500\tfar:0-60000   near:1000- ").getSpanCount(), 3U);
}

TEST(GesturePattern, RefusesWhatIsNoSpan) {
    EXPECT_THAT(parseBad(""), HasSubstr("needs a span"));
    EXPECT_THAT(parseBad("   "), HasSubstr("needs a span"));
    EXPECT_THAT(parseBad("close:1-2"), HasSubstr("near: or far:"));
    EXPECT_THAT(parseBad("near"), HasSubstr("near: or far:"));
    EXPECT_THAT(parseBad("Near:1-2"), HasSubstr("near: or far:"));
    EXPECT_THAT(parseBad("near:100"), HasSubstr("has no \"-\""));
    EXPECT_THAT(parseBad("near:1-2 nonsense"), HasSubstr("\"nonsense\""));
}

TEST(GesturePattern, RefusesLengthsOutOfRange) {
    for (const char* text :
         {"near:-5", "near:a-5", "near:1-b", "near:1-60001", "near:60001-",
          "near:99999999999999999999-", "near:+1-5", "near:1-2-3", "near:1--2", "near:1.5-2"}) {
        EXPECT_THAT(parseBad(text), HasSubstr("milliseconds from 0 to 60000")) << text;
    }
    EXPECT_THAT(parseBad("near:500-50"), HasSubstr("maximum below its minimum"));
}

TEST(GesturePattern, RefusesTwoSpansOfOneKindInARow) {
    EXPECT_THAT(parseBad("near:1-2 near:1-2"), HasSubstr("take turns"));
}

TEST(GesturePattern, TakesSixteenSpansAndNotMore) {
    std::string text;
    for (std::size_t index = 0; index < GesturePattern::SPANS_MAX; ++index) {
        text += index % 2 == 0 ? "near:1-2 " : "far:1-2 ";
    }
    EXPECT_EQ(parse(text).getSpanCount(), GesturePattern::SPANS_MAX);
    EXPECT_THAT(parseBad(text + "near:1-2"), HasSubstr("more than 16 spans"));
}

TEST(GesturePattern, IsCompletedByTheNewestSpansWithinTheirBounds) {
    const GesturePattern pattern = parse("near:100-200 far:0-300");
    EXPECT_TRUE(pattern.isCompletedBy({{true, 100}, {false, 300}}));
    EXPECT_TRUE(pattern.isCompletedBy({{false, 9000}, {true, 200}, {false, 0}}));
    EXPECT_FALSE(pattern.isCompletedBy({{true, 99}, {false, 300}}));
    EXPECT_FALSE(pattern.isCompletedBy({{true, 201}, {false, 300}}));
    EXPECT_FALSE(pattern.isCompletedBy({{true, 100}, {false, 301}}));
    EXPECT_FALSE(pattern.isCompletedBy({{false, 300}}));
    EXPECT_FALSE(pattern.isCompletedBy({{true, 100}, {false, 300}, {true, 150}}));
    EXPECT_FALSE(pattern.getCompletingLength({{true, 100}}, false));
}

TEST(GesturePattern, WithoutAMaximumIsCompletedByALengthAndNotByAnEnd) {
    const GesturePattern pattern = parse("near:100-200 far:600-");
    EXPECT_EQ(pattern.getCompletingLength({{true, 150}}, false), 600);
    EXPECT_FALSE(pattern.getCompletingLength({{true, 150}}, true));
    EXPECT_FALSE(pattern.getCompletingLength({{true, 201}}, false));
    EXPECT_FALSE(pattern.isCompletedBy({{true, 150}, {false, 700}}));
}

}  // namespace
