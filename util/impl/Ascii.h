/**
 * @file
 * Letters, the same in every locale.
 */
#pragma once

namespace Util {

/** Maps A to Z to lower case; other bytes stay. */
inline char toLowerAscii(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

}  // namespace Util
