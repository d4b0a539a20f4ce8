#include "core/util/Base64Coder.h"

#include <gtest/gtest.h>

#include <random>

using Util::Base64Coder;

namespace {

std::vector<unsigned char> bytesOf(const std::string& text) {
    return std::vector<unsigned char>(text.begin(), text.end());
}

TEST(Base64Coder, MatchesTheKnownVectors) {
    const std::pair<const char*, const char*> vectors[] = {
        {"", ""},
        {"f", "Zg=="},
        {"fo", "Zm8="},
        {"foo", "Zm9v"},
        {"foob", "Zm9vYg=="},
        {"fooba", "Zm9vYmE="},
        {"foobar", "Zm9vYmFy"},
    };
    for (const auto& vector : vectors) {
        EXPECT_EQ(vector.second, Base64Coder::encode(bytesOf(vector.first)));
        std::vector<unsigned char> decoded{1, 2, 3};
        EXPECT_TRUE(Base64Coder::decode(vector.second, decoded)) << vector.second;
        EXPECT_EQ(bytesOf(vector.first), decoded);
    }
}

TEST(Base64Coder, UsesTheStandardAlphabet) {
    EXPECT_EQ("+/+/", Base64Coder::encode({0xFB, 0xFF, 0xBF}));
}

TEST(Base64Coder, DecodesWhatItEncoded) {
    std::mt19937 random(3);
    for (std::size_t size = 0; size < 100; ++size) {
        std::vector<unsigned char> bytes(size);
        for (unsigned char& byte : bytes) {
            byte = static_cast<unsigned char>(random());
        }
        std::vector<unsigned char> decoded;
        EXPECT_TRUE(Base64Coder::decode(Base64Coder::encode(bytes), decoded));
        EXPECT_EQ(bytes, decoded);
    }
}

TEST(Base64Coder, RefusesEveryOtherText) {
    const std::string bad[] = {
        "Z",        "Zg",           "Zg=",     "=",    "====", "Z===",    "=Zg=",     "Zg=Z",
        "Zg==Zg==", "Zm9v\n",       " Zm9v",   "Zm 9", "Zm-_", "Zm9\xC3", "Zm9v====", "Zm9vZg",
        "Zm9*",     "Zg==\n\n\n\n", "Zm9vYmF",
    };
    for (const std::string& text : bad) {
        std::vector<unsigned char> decoded{1, 2, 3};
        EXPECT_FALSE(Base64Coder::decode(text, decoded)) << text;
        EXPECT_TRUE(decoded.empty()) << text;
    }
    std::vector<unsigned char> decoded;
    EXPECT_FALSE(Base64Coder::decode(std::string("Zm9\0", 4), decoded));
}

TEST(Base64Coder, RefusesUnusedBitsThatAreSet) {
    std::vector<unsigned char> decoded;
    EXPECT_FALSE(Base64Coder::decode("Zh==", decoded));
    EXPECT_FALSE(Base64Coder::decode("Zm9=", decoded));
}

}  // namespace
