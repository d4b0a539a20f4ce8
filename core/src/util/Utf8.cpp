#include "util/Utf8.h"

#include <cstddef>

namespace Util {

namespace {

/** What may stand after a lead byte; all continuation bytes but the first are 0x80 to 0xBF. */
struct Sequence {
    std::size_t continuations;
    unsigned char firstLow;
    unsigned char firstHigh;
};

// The narrowed ranges exclude overlong forms, surrogates and what lies beyond U+10FFFF.
bool findSequence(unsigned char lead, Sequence& sequence) {
    if (lead >= 0xC2 && lead <= 0xDF) {
        sequence = {1, 0x80, 0xBF};
    } else if (lead >= 0xE0 && lead <= 0xEF) {
        sequence = {2, static_cast<unsigned char>(lead == 0xE0 ? 0xA0 : 0x80),
                    static_cast<unsigned char>(lead == 0xED ? 0x9F : 0xBF)};
    } else if (lead >= 0xF0 && lead <= 0xF4) {
        sequence = {3, static_cast<unsigned char>(lead == 0xF0 ? 0x90 : 0x80),
                    static_cast<unsigned char>(lead == 0xF4 ? 0x8F : 0xBF)};
    } else {
        return false;
    }
    return true;
}

}  // namespace

std::size_t utf8PrefixLength(const std::string& bytes) {
    std::size_t length = 0;
    while (length < bytes.size()) {
        const auto lead = static_cast<unsigned char>(bytes[length]);
        if (lead == 0) {
            return length;
        }
        Sequence sequence{};
        if (lead >= 0x80 &&
            (!findSequence(lead, sequence) || sequence.continuations >= bytes.size() - length)) {
            return length;
        }
        for (std::size_t n = 1; n <= sequence.continuations; ++n) {
            const auto byte = static_cast<unsigned char>(bytes[length + n]);
            const unsigned char low = n == 1 ? sequence.firstLow : 0x80;
            const unsigned char high = n == 1 ? sequence.firstHigh : 0xBF;
            if (byte < low || byte > high) {
                return length;
            }
        }
        length += 1 + sequence.continuations;
    }
    return length;
}

bool isUtf8Text(const std::string& bytes) {
    return utf8PrefixLength(bytes) == bytes.size();
}

void appendUtf8(std::string& text, char16_t character) {
    const auto code = static_cast<unsigned>(character);
    if (code < 0x80) {
        text += static_cast<char>(code);
        return;
    }
    if (code < 0x800) {
        text += static_cast<char>(0xC0U | (code >> 6U));
    } else {
        text += static_cast<char>(0xE0U | (code >> 12U));
        text += static_cast<char>(0x80U | ((code >> 6U) & 0x3FU));
    }
    text += static_cast<char>(0x80U | (code & 0x3FU));
}

}  // namespace Util
