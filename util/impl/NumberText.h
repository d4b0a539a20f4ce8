/**
 * @file
 * Numbers in texts, the same in every locale.
 */
#pragma once

#include <cstddef>
#include <string>

namespace Util {

/**
 * Reads numbers as the `%i` and `%g` conversions of C's `scanf` do in the "C" locale, with three
 * exceptions: a number out of range becomes the nearest end of the range, infinity ("inf" or
 * "infinity" in any case, as a whole word) is such a number, and "nan" is not a number. Text
 * behind the number is left unread.
 */
class NumberText {
  public:
    enum Status { NUMBER, NOT_A_NUMBER, OUT_OF_RANGE };

    /** A number that was read; 0 where there is none. */
    template <typename Number>
    struct Reading {
        Number value = 0;
        Status status = NOT_A_NUMBER;
        /** Where in the text the number ends; meaningless where there is none. */
        std::size_t end = 0;
    };

    /** Decimal, hexadecimal after "0x", octal after "0". */
    static Reading<int> readInt(const std::string& text);

    /** Decimal or, after "0x", hexadecimal. @param start where to begin, within the text */
    static Reading<float> readFloat(const std::string& text, std::size_t start = 0);

    /** Six significant digits, the shortest of fixed and exponent form. */
    static std::string writeFloat(float value);
};

}  // namespace Util
