/**
 * @file
 * Classes of ASCII characters, the same in every locale. Bytes beyond ASCII belong to none.
 */
#pragma once

#include <algorithm>
#include <cstddef>
#include <string>

namespace Util {

/** "0" to "9". */
inline bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

/** "A" to "Z" and "a" to "z". */
inline bool isLetter(char c) {
    return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z');
}

/** The space, and the controls from the tab to the carriage return. */
inline bool isWhiteSpace(char c) {
    return c == ' ' || (c >= '\t' && c <= '\r');
}

/** The characters below the space, and DEL. */
inline bool isControl(char c) {
    const auto byte = static_cast<unsigned char>(c);
    return byte < 0x20 || byte == 0x7F;
}

/** Value of a hexadecimal digit of either case; -1 for any other character. */
inline int hexValue(char c) {
    if (isDigit(c)) {
        return c - '0';
    }
    if (c >= 'a' && c <= 'f') {
        return c - 'a' + 10;
    }
    return c >= 'A' && c <= 'F' ? c - 'A' + 10 : -1;
}

/** Maps "A" to "Z" to lower case; other bytes stay. */
inline char toLower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

/** Maps each character of a text. */
inline std::string toLower(std::string text) {
    std::transform(text.begin(), text.end(), text.begin(), [](char c) { return toLower(c); });
    return text;
}

/**
 * Whether `lower`, which has no capital letters, stands in the text at `position`, in any case.
 * @param position at most the size of the text
 */
inline bool isAtNoCase(const std::string& text, std::size_t position, const std::string& lower) {
    return text.size() - position >= lower.size() &&
           std::equal(lower.begin(), lower.end(),
                      text.begin() + static_cast<std::ptrdiff_t>(position),
                      [](char expected, char c) { return toLower(c) == expected; });
}

}  // namespace Util
