#include "core/util/UrlCoder.h"

#include "core/util/Ascii.h"

namespace Util {

namespace {

const char* const HEX_DIGITS = "0123456789ABCDEF";

bool isUnreserved(char c) {
    return isLetter(c) || isDigit(c) || c == '-' || c == '_' || c == '.' || c == '~';
}

}  // namespace

std::string UrlCoder::urlEncodeString(const std::string& text) {
    // Most of what a usage record costs besides its request: so not one character at a time.
    std::string encoded(text.size() * 3, '\0');
    auto end = encoded.begin();
    for (const char c : text) {
        if (isUnreserved(c)) {
            *end++ = c;
        } else {
            const auto byte = static_cast<unsigned char>(c);
            *end++ = '%';
            *end++ = HEX_DIGITS[byte >> 4];
            *end++ = HEX_DIGITS[byte & 0x0F];
        }
    }
    encoded.erase(end, encoded.end());
    return encoded;
}

std::string UrlCoder::urlDecodeString(const std::string& text) {
    std::string decoded;
    decoded.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        const bool complete = text[i] == '%' && text.size() - i > 2;
        const int high = complete ? hexValue(text[i + 1]) : -1;
        const int low = complete ? hexValue(text[i + 2]) : -1;
        if (high >= 0 && low >= 0) {
            decoded += static_cast<char>(high * 16 + low);
            i += 2;
        } else {
            decoded += text[i];
        }
    }
    return decoded;
}

}  // namespace Util
