#include "Text.h"

#include <algorithm>
#include <array>
#include <charconv>

#include "core/util/Ascii.h"

namespace Cli {

namespace {

const int TIME_COLUMNS = 6;

bool isContinuation(char byte) {
    return (static_cast<unsigned char>(byte) & 0xC0U) == 0x80U;
}

}  // namespace

std::string fixed(double value, int columns, int decimals) {
    // Enough for any double; unlike printf it writes a point in every locale.
    std::array<char, 512> text;
    const auto [end, error] = std::to_chars(text.data(), text.data() + text.size(), value,
                                            std::chars_format::fixed, decimals);
    const std::string digits(text.data(), error == std::errc() ? end : text.data());
    const auto width = static_cast<std::size_t>(std::max(0, columns));
    return digits.size() < width ? std::string(width - digits.size(), ' ') + digits : digits;
}

std::string timeColumn(int64_t ms) {
    return fixed(static_cast<double>(ms), TIME_COLUMNS, 0) + " ms  ";
}

std::size_t characterCount(const std::string& text) {
    return text.size() -
           static_cast<std::size_t>(std::count_if(text.begin(), text.end(), isContinuation));
}

std::string padded(const std::string& text, std::size_t columns) {
    const std::size_t used = characterCount(text);
    return used < columns ? text + std::string(columns - used, ' ') : text;
}

std::string printable(const std::string& text) {
    std::string result;
    for (std::size_t index = 0; index < text.size(); ++index) {
        const auto byte = static_cast<unsigned char>(text[index]);
        const auto next =
            static_cast<unsigned char>(index + 1 < text.size() ? text[index + 1] : '\0');
        if (byte == 0xC2U && next >= 0x80U && next < 0xA0U) {
            // The control characters U+0080 to U+009F.
            result += '?';
            ++index;
        } else {
            result += Util::isControl(text[index]) ? '?' : text[index];
        }
    }
    return result;
}

}  // namespace Cli
