#include "platforms/android/jni/Utf16.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using Jni::Utf16;
using Jni::utf16ToUtf8;
using Jni::utf8ToUtf16;

std::string toUtf8(const Utf16& units) {
    return utf16ToUtf8(units.data(), units.size());
}

std::string bytes(std::initializer_list<int> values) {
    std::string text;
    for (const int value : values) {
        text.push_back(static_cast<char>(static_cast<unsigned char>(value)));
    }
    return text;
}

TEST(Utf16, CarriesEveryLengthOfCharacterBothWays) {
    const std::string text = "a\x7f" +
                             bytes({0xC2, 0x80, 0xDF, 0xBF, 0xE0, 0xA0, 0x80, 0xEF, 0xBF, 0xBF}) +
                             bytes({0xF0, 0x90, 0x80, 0x80, 0xF4, 0x8F, 0xBF, 0xBF});
    const Utf16 units{'a', 0x7F, 0x80, 0x7FF, 0x800, 0xFFFF, 0xD800, 0xDC00, 0xDBFF, 0xDFFF};
    EXPECT_EQ(utf8ToUtf16(text), units);
    EXPECT_EQ(toUtf8(units), text);
}

TEST(Utf16, KeepsZeroAndNothing) {
    const std::string text("a\0b", 3);
    EXPECT_EQ(utf8ToUtf16(text), (Utf16{'a', 0, 'b'}));
    EXPECT_EQ(toUtf8({'a', 0, 'b'}), text);
    EXPECT_TRUE(utf8ToUtf16("").empty());
    EXPECT_EQ(utf16ToUtf8(nullptr, 0), "");
}

TEST(Utf16, CarriesEveryCharacterThatThereIs) {
    for (unsigned character = 0; character <= 0x10FFFF; ++character) {
        if (character >= 0xD800 && character < 0xE000) {
            continue;
        }
        Utf16 units;
        if (character < 0x10000) {
            units = {static_cast<std::uint16_t>(character)};
        } else {
            units = {static_cast<std::uint16_t>(0xD800 + ((character - 0x10000) >> 10)),
                     static_cast<std::uint16_t>(0xDC00 + (character & 0x3FF))};
        }
        ASSERT_EQ(utf8ToUtf16(toUtf8(units)), units) << character;
    }
}

TEST(Utf16, ReplacesBytesThatAreNoCharacter) {
    const Utf16 one{0xFFFD};
    const Utf16 two{0xFFFD, 0xFFFD};
    const Utf16 three{0xFFFD, 0xFFFD, 0xFFFD};
    EXPECT_EQ(utf8ToUtf16(bytes({0x80})), one);
    EXPECT_EQ(utf8ToUtf16(bytes({0xFF})), one);
    EXPECT_EQ(utf8ToUtf16(bytes({0xC0, 0x80})), two) << "a zero that is too long";
    EXPECT_EQ(utf8ToUtf16(bytes({0xE0, 0x9F, 0xBF})), three) << "too long";
    EXPECT_EQ(utf8ToUtf16(bytes({0xED, 0xA0, 0x80})), three) << "a surrogate";
    EXPECT_EQ(utf8ToUtf16(bytes({0xF4, 0x90, 0x80, 0x80})).size(), 4U) << "too large";
    EXPECT_EQ(utf8ToUtf16(bytes({0xF5, 0x80})), two);
}

TEST(Utf16, ReplacesWhatIsCutShortOnce) {
    EXPECT_EQ(utf8ToUtf16(bytes({0xC3})), (Utf16{0xFFFD}));
    EXPECT_EQ(utf8ToUtf16(bytes({0xE2, 0x82})), (Utf16{0xFFFD}));
    EXPECT_EQ(utf8ToUtf16(bytes({0xF0, 0x9F, 0x98})), (Utf16{0xFFFD}));
    EXPECT_EQ(utf8ToUtf16(bytes({0xF0, 0x9F, 'x'})), (Utf16{0xFFFD, 'x'}));
    EXPECT_EQ(utf8ToUtf16(bytes({0xE2, 0xE2, 0x82, 0xAC})), (Utf16{0xFFFD, 0x20AC}));
}

TEST(Utf16, ReplacesUnpairedSurrogates) {
    const std::string replacement = bytes({0xEF, 0xBF, 0xBD});
    EXPECT_EQ(toUtf8({0xD800}), replacement);
    EXPECT_EQ(toUtf8({0xDC00}), replacement);
    EXPECT_EQ(toUtf8({0xD800, 'x'}), replacement + "x");
    EXPECT_EQ(toUtf8({0xDC00, 0xD800}), replacement + replacement);
    EXPECT_EQ(toUtf8({0xD800, 0xD83D, 0xDE00}), replacement + bytes({0xF0, 0x9F, 0x98, 0x80}));
}

}  // namespace
