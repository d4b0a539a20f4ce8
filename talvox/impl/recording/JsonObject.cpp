#include "talvox/impl/recording/JsonObject.h"

#include <array>
#include <cmath>
#include <cstddef>

#include "pal/kd_log.h"

namespace Talvox {

namespace {

const char* const REPLACEMENT = "\xEF\xBF\xBD";

bool isContinuation(char byte) {
    return (static_cast<unsigned char>(byte) & 0xC0U) == 0x80;
}

/** Length of the UTF-8 sequence at the beginning of a text; 0 if there is none. */
std::size_t measureSequence(std::string_view text) {
    const auto first = static_cast<unsigned char>(text[0]);
    const std::size_t size = first < 0x80                     ? 1
                             : first >= 0xC2 && first < 0xE0  ? 2
                             : first >= 0xE0 && first < 0xF0  ? 3
                             : first >= 0xF0 && first <= 0xF4 ? 4
                                                              : 0;
    if (size > text.size()) {
        return 0;
    }
    for (std::size_t i = 1; i < size; ++i) {
        if (!isContinuation(text[i])) {
            return 0;
        }
    }
    if (size > 2) {
        const auto second = static_cast<unsigned char>(text[1]);
        const bool isOverlong =
            (first == 0xE0 && second < 0xA0) || (first == 0xF0 && second < 0x90);
        const bool isSurrogate = first == 0xED && second >= 0xA0;
        const bool isTooLarge = first == 0xF4 && second >= 0x90;
        return isOverlong || isSurrogate || isTooLarge ? 0 : size;
    }
    return size;
}

void appendQuoted(std::string& text, std::string_view value) {
    text += '"';
    while (!value.empty()) {
        const std::size_t size = measureSequence(value);
        if (size == 0) {
            text += REPLACEMENT;
        } else if (value[0] == '"' || value[0] == '\\') {
            text += '\\';
            text += value[0];
        } else if (static_cast<unsigned char>(value[0]) < 0x20 || value[0] == 0x7F) {
            std::array<char, 8> escape{};
            kdSprintf_s(escape.data(), escape.size(), "\\u%04x", static_cast<unsigned>(value[0]));
            text += escape.data();
        } else {
            text.append(value.data(), size);
        }
        value.remove_prefix(size == 0 ? 1 : size);
    }
    text += '"';
}

}  // namespace

void JsonObject::addName(std::string_view name) {
    text += text.empty() ? '{' : ',';
    appendQuoted(text, name);
    text += ':';
}

JsonObject& JsonObject::add(std::string_view name, int64_t value) {
    addName(name);
    text += std::to_string(value);
    return *this;
}

JsonObject& JsonObject::addBoolean(std::string_view name, bool value) {
    addName(name);
    text += value ? "true" : "false";
    return *this;
}

JsonObject& JsonObject::addNumber(std::string_view name, float value) {
    addName(name);
    text += formatNumber(value);
    return *this;
}

JsonObject& JsonObject::addText(std::string_view name, std::string_view value) {
    addName(name);
    appendQuoted(text, value);
    return *this;
}

JsonObject& JsonObject::addJson(std::string_view name, std::string_view json) {
    addName(name);
    text += json;
    return *this;
}

// Nine digits give the same float back.
std::string JsonObject::formatNumber(float value) {
    if (!std::isfinite(value)) {
        return "null";
    }
    std::array<char, 32> digits{};
    kdSprintf_s(digits.data(), digits.size(), "%.9g", static_cast<double>(value));
    return digits.data();
}

}  // namespace Talvox
