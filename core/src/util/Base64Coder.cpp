#include "core/util/Base64Coder.h"

#include <cstddef>
#include <cstdint>

#include "core/util/Ascii.h"

namespace Util {

namespace {

const char* const ALPHABET = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
constexpr char PADDING = '=';
constexpr std::size_t GROUP_BYTES = 3;
constexpr std::size_t GROUP_CHARACTERS = 4;
constexpr unsigned DIGIT_BITS = 6;
constexpr unsigned BYTE_BITS = 8;

int digitValue(char c) {
    if (c >= 'A' && c <= 'Z') {
        return c - 'A';
    }
    if (c >= 'a' && c <= 'z') {
        return c - 'a' + 26;
    }
    if (isDigit(c)) {
        return c - '0' + 52;
    }
    if (c == '+') {
        return 62;
    }
    return c == '/' ? 63 : -1;
}

std::size_t countPadding(const std::string& text) {
    std::size_t count = 0;
    while (count < 2 && count < text.size() && text[text.size() - 1 - count] == PADDING) {
        ++count;
    }
    return count;
}

bool decodeDigits(const std::string& text, std::size_t digits, std::vector<unsigned char>& bytes) {
    std::uint32_t bits = 0;
    unsigned available = 0;
    for (std::size_t i = 0; i < digits; ++i) {
        const int value = digitValue(text[i]);
        if (value < 0) {
            return false;
        }
        bits = (bits << DIGIT_BITS) | static_cast<std::uint32_t>(value);
        available += DIGIT_BITS;
        if (available >= BYTE_BITS) {
            available -= BYTE_BITS;
            bytes.push_back(static_cast<unsigned char>((bits >> available) & 0xFF));
        }
    }
    // What is left over belongs to no byte and must be zero.
    return (bits & ((1U << available) - 1)) == 0;
}

}  // namespace

std::string Base64Coder::encode(const std::vector<unsigned char>& bytes) {
    std::string text;
    text.reserve((bytes.size() + GROUP_BYTES - 1) / GROUP_BYTES * GROUP_CHARACTERS);
    for (std::size_t i = 0; i < bytes.size(); i += GROUP_BYTES) {
        std::uint32_t group = 0;
        for (std::size_t j = 0; j < GROUP_BYTES; ++j) {
            group = (group << BYTE_BITS) | (i + j < bytes.size() ? bytes[i + j] : 0U);
        }
        for (std::size_t j = 0; j < GROUP_CHARACTERS; ++j) {
            const unsigned shift = DIGIT_BITS * static_cast<unsigned>(GROUP_CHARACTERS - 1 - j);
            text += i + j > bytes.size() ? PADDING : ALPHABET[(group >> shift) & 0x3F];
        }
    }
    return text;
}

bool Base64Coder::decode(const std::string& text, std::vector<unsigned char>& bytes) {
    bytes.clear();
    if (text.size() % GROUP_CHARACTERS != 0) {
        return false;
    }
    bytes.reserve(text.size() / GROUP_CHARACTERS * GROUP_BYTES);
    if (!decodeDigits(text, text.size() - countPadding(text), bytes)) {
        bytes.clear();
        return false;
    }
    return true;
}

}  // namespace Util
