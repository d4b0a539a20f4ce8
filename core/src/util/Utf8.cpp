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

bool isUtf8Text(const std::string& bytes) {
    std::size_t i = 0;
    while (i < bytes.size()) {
        const auto lead = static_cast<unsigned char>(bytes[i++]);
        if (lead == 0) {
            return false;
        }
        if (lead < 0x80) {
            continue;
        }
        Sequence sequence{};
        if (!findSequence(lead, sequence) || sequence.continuations > bytes.size() - i) {
            return false;
        }
        for (std::size_t n = 0; n < sequence.continuations; ++n, ++i) {
            const auto byte = static_cast<unsigned char>(bytes[i]);
            const unsigned char low = n == 0 ? sequence.firstLow : 0x80;
            const unsigned char high = n == 0 ? sequence.firstHigh : 0xBF;
            if (byte < low || byte > high) {
                return false;
            }
        }
    }
    return true;
}

}  // namespace Util
