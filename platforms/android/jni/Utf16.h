/**
 * @file
 * Between the text of Java and that of the engine.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace Jni {

using Utf16 = std::vector<std::uint16_t>;

/**
 * UTF-8 in its standard form to UTF-16. Every longest run of bytes that begins a character and
 * does not end it, and every byte that begins none, becomes one U+FFFD. Zero bytes stay.
 */
Utf16 utf8ToUtf16(const std::string& bytes);

/** UTF-16 to standard UTF-8; an unpaired surrogate becomes U+FFFD. */
std::string utf16ToUtf8(const std::uint16_t* units, std::size_t count);

}  // namespace Jni
