#pragma once

namespace Util {

/** Maps A to Z to lower case, in every locale; other bytes stay. */
inline char toLower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

}  // namespace Util
