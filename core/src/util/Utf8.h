#pragma once

#include <cstddef>
#include <string>

namespace Util {

/**
 * How many of the bytes, from the first, are UTF-8 in its shortest form, without surrogates and
 * zero bytes. Never ends within a character.
 */
std::size_t utf8PrefixLength(const std::string& bytes);

/** Whether all of the bytes are such UTF-8. */
bool isUtf8Text(const std::string& bytes);

/** Appends a character, at most U+FFFF and not a surrogate. */
void appendUtf8(std::string& text, char16_t character);

}  // namespace Util
