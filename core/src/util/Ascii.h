#pragma once

#include <cstddef>
#include <string>

namespace Util {

/** Maps A to Z to lower case, in every locale; other bytes stay. */
inline char toLower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

/**
 * Whether `lower`, which has no capital letters, stands in the text at `position`, in any case.
 * @param position at most the size of the text
 */
inline bool isAtNoCase(const std::string& text, std::size_t position, const std::string& lower) {
    if (text.size() - position < lower.size()) {
        return false;
    }
    for (std::size_t i = 0; i < lower.size(); ++i) {
        if (toLower(text[position + i]) != lower[i]) {
            return false;
        }
    }
    return true;
}

}  // namespace Util
