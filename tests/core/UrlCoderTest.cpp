#include "core/util/UrlCoder.h"

#include <gtest/gtest.h>

using Util::UrlCoder;

namespace {

TEST(UrlCoder, LeavesUnreservedCharactersAlone) {
    const std::string unreserved =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_.~";
    EXPECT_EQ(unreserved, UrlCoder::urlEncodeString(unreserved));
    EXPECT_EQ(unreserved, UrlCoder::urlDecodeString(unreserved));
}

TEST(UrlCoder, EncodesEverythingElse) {
    EXPECT_EQ("", UrlCoder::urlEncodeString(""));
    EXPECT_EQ("a%20b%26c%3Dd%2Be%2Ff%25", UrlCoder::urlEncodeString("a b&c=d+e/f%"));
    EXPECT_EQ("%D1%8F%0A%7F%FF", UrlCoder::urlEncodeString("\xD1\x8F\n\x7F\xFF"));
    EXPECT_EQ("a%00b", UrlCoder::urlEncodeString(std::string("a\0b", 3)));
}

TEST(UrlCoder, DecodesWhatItEncoded) {
    std::string all;
    for (int byte = 0; byte < 256; ++byte) {
        all += static_cast<char>(byte);
    }
    EXPECT_EQ(all, UrlCoder::urlDecodeString(UrlCoder::urlEncodeString(all)));
}

TEST(UrlCoder, DecodesLowerCaseDigitsAndLeavesAPlus) {
    EXPECT_EQ("a/b+c", UrlCoder::urlDecodeString("a%2fb+c"));
}

TEST(UrlCoder, LeavesMalformedEscapesAsTheyAre) {
    EXPECT_EQ("%", UrlCoder::urlDecodeString("%"));
    EXPECT_EQ("%4", UrlCoder::urlDecodeString("%4"));
    EXPECT_EQ("%G1%1G", UrlCoder::urlDecodeString("%G1%1G"));
    EXPECT_EQ("%A", UrlCoder::urlDecodeString("%%41"));
}

}  // namespace
