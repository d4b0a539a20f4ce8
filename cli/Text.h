#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

namespace Cli {

/** A number with `decimals` digits behind the point, right-aligned in `columns`. */
std::string fixed(double value, int columns, int decimals);

/** A time in milliseconds as a column of the tool's output. */
std::string timeColumn(int64_t ms);

/** The text with blanks behind it, up to `columns` characters (of UTF-8, not bytes). */
std::string padded(const std::string& text, std::size_t columns);

/** Characters of a UTF-8 text. */
std::size_t characterCount(const std::string& text);

/** Text from outside with everything taken out that could control a terminal. */
std::string printable(const std::string& text);

}  // namespace Cli
