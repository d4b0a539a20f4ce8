#include "util/impl/NumberText.h"

#include <locale.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cfloat>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <new>

#include "core/util/Ascii.h"

namespace Util {

namespace {

/** A place in a text; beyond its end there are zero bytes. */
class Cursor {
  public:
    Cursor(const std::string& whole, std::size_t start) : text(whole), at(start) {}

    char peek(std::size_t ahead = 0) const {
        return at + ahead < text.size() ? text[at + ahead] : '\0';
    }
    void skip(std::size_t count = 1) { at += count; }
    std::size_t position() const { return at; }
    std::string since(std::size_t start) const { return text.substr(start, at - start); }

    void skipBlanks() {
        while (isWhiteSpace(peek())) {
            skip();
        }
    }

    /** Skips digits and tells how many. */
    std::size_t skipDigits() {
        const std::size_t start = at;
        while (isDigit(peek())) {
            skip();
        }
        return at - start;
    }

    /** Skips an exponent if a whole one with this (lower case) letter follows. */
    void skipExponent(char letter) {
        const std::size_t sign = peek(1) == '+' || peek(1) == '-' ? 1 : 0;
        if (toLower(peek()) == letter && isDigit(peek(1 + sign))) {
            skip(1 + sign);
            skipDigits();
        }
    }

    /** Skips a word (in lower case) if it stands here in any case and ends here. */
    bool skipWord(const char* word) {
        std::size_t length = 0;
        for (; word[length] != '\0'; ++length) {
            if (toLower(peek(length)) != word[length]) {
                return false;
            }
        }
        const char next = toLower(peek(length));
        if (isDigit(next) || next == '_' || isLetter(next)) {
            return false;
        }
        skip(length);
        return true;
    }

    bool isAtHexadecimal() const {
        return peek() == '0' && toLower(peek(1)) == 'x' &&
               (hexValue(peek(2)) >= 0 || (peek(2) == '.' && hexValue(peek(3)) >= 0));
    }

  private:
    const std::string& text;
    std::size_t at;
};

/** Reads from behind the "0x"; beyond the range of floats the value is merely large. */
double readHexadecimal(Cursor& cursor) {
    double mantissa = 0;
    int exponent = 0;
    bool fraction = false;
    for (;; cursor.skip()) {
        const int digit = hexValue(cursor.peek());
        if (digit >= 0) {
            mantissa = mantissa * 16 + digit;
            exponent -= fraction ? 4 : 0;
        } else if (cursor.peek() == '.' && !fraction) {
            fraction = true;
        } else {
            break;
        }
    }
    const std::size_t start = cursor.position();
    cursor.skipExponent('p');
    if (cursor.position() > start) {
        const std::string written = cursor.since(start + 1);
        const long power = std::strtol(written.c_str(), nullptr, 10);
        constexpr long LIMIT = 1000000000L;
        exponent += static_cast<int>(std::clamp(power, -LIMIT, LIMIT));
    }
    return std::ldexp(mantissa, exponent);
}

/** Skips a decimal number and tells whether there is one. */
bool skipDecimal(Cursor& cursor) {
    std::size_t digits = cursor.skipDigits();
    if (cursor.peek() == '.' && (digits > 0 || isDigit(cursor.peek(1)))) {
        cursor.skip();
        digits += cursor.skipDigits();
    }
    if (digits == 0) {
        return false;
    }
    cursor.skipExponent('e');
    return true;
}

/**
 * Makes the C library's conversions in this thread use a decimal point while the object lives.
 * Streams are avoided: with a static C++ run time they add its locales to the library.
 */
class DecimalPoint {
  public:
    DecimalPoint() : old(uselocale(classic())) {}
    ~DecimalPoint() { uselocale(old); }
    DecimalPoint(const DecimalPoint&) = delete;
    DecimalPoint& operator=(const DecimalPoint&) = delete;

  private:
    static locale_t classic() {
        // Kept for the rest of the process.
        static const locale_t made = [] {
            const locale_t locale = newlocale(LC_ALL_MASK, "C", nullptr);
            if (locale == nullptr) {
                throw std::bad_alloc();  // the next use tries again
            }
            return locale;
        }();
        return made;
    }

    const locale_t old;
};

/** @param written a whole decimal number */
double convertDecimal(const std::string& written) {
    const DecimalPoint decimalPoint;
    // Reading a float, not a double, rounds once.
    const float value = std::strtof(written.c_str(), nullptr);
    return std::isinf(value) ? HUGE_VAL : static_cast<double>(value);
}

}  // namespace

NumberText::Reading<int> NumberText::readInt(const std::string& text) {
    Reading<int> reading;
    const char* begin = text.c_str();
    char* end = nullptr;
    errno = 0;
    const long long value = std::strtoll(begin, &end, 0);
    if (end == begin) {
        return reading;
    }
    constexpr long long LOWEST = std::numeric_limits<int>::min();
    constexpr long long HIGHEST = std::numeric_limits<int>::max();
    const long long nearest = std::clamp(value, LOWEST, HIGHEST);
    reading.value = static_cast<int>(nearest);
    reading.status = nearest == value && errno != ERANGE ? NUMBER : OUT_OF_RANGE;
    reading.end = static_cast<std::size_t>(end - begin);
    return reading;
}

NumberText::Reading<float> NumberText::readFloat(const std::string& text, std::size_t start) {
    Reading<float> reading;
    Cursor cursor(text, start);
    cursor.skipBlanks();
    const bool isNegative = cursor.peek() == '-';
    if (isNegative || cursor.peek() == '+') {
        cursor.skip();
    }
    double value = 0;
    if (cursor.isAtHexadecimal()) {
        cursor.skip(2);
        value = readHexadecimal(cursor);
    } else if (cursor.skipWord("inf") || cursor.skipWord("infinity")) {
        value = HUGE_VAL;
    } else {
        const std::size_t first = cursor.position();
        if (!skipDecimal(cursor)) {
            return reading;
        }
        value = convertDecimal(cursor.since(first));
    }
    reading.status = value > static_cast<double>(FLT_MAX) ? OUT_OF_RANGE : NUMBER;
    const auto nearest = static_cast<float>(std::min(value, static_cast<double>(FLT_MAX)));
    reading.value = isNegative ? -nearest : nearest;
    reading.end = cursor.position();
    return reading;
}

std::string NumberText::writeFloat(float value) {
    const DecimalPoint decimalPoint;
    std::array<char, 32> text = {};
    std::snprintf(text.data(), text.size(), "%g", static_cast<double>(value));
    return text.data();
}

}  // namespace Util
