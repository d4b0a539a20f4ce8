#include "Utf16.h"

namespace Jni {

namespace {

constexpr std::uint32_t REPLACEMENT = 0xFFFD;
constexpr std::uint32_t SUPPLEMENTARY = 0x10000;
constexpr std::uint32_t HIGH_SURROGATE = 0xD800;
constexpr std::uint32_t LOW_SURROGATE = 0xDC00;
constexpr std::uint32_t SURROGATE_END = 0xE000;

bool isBetween(std::uint32_t value, std::uint32_t first, std::uint32_t end) {
    return value >= first && value < end;
}

std::uint8_t byteAt(const std::string& bytes, std::size_t position) {
    return static_cast<std::uint8_t>(bytes[position]);
}

/** How many bytes follow the first one; 0 for one that begins nothing. */
unsigned countFollowing(std::uint8_t first) {
    if (isBetween(first, 0xC2, 0xE0)) {
        return 1;
    }
    if (isBetween(first, 0xE0, 0xF0)) {
        return 2;
    }
    return isBetween(first, 0xF0, 0xF5) ? 3 : 0;
}

/** Whether the second byte may follow the first: shortest form, no surrogates, not too large. */
bool isSecond(std::uint8_t first, std::uint8_t second) {
    switch (first) {
        case 0xE0:
            return isBetween(second, 0xA0, 0xC0);
        case 0xED:
            return isBetween(second, 0x80, 0xA0);
        case 0xF0:
            return isBetween(second, 0x90, 0xC0);
        case 0xF4:
            return isBetween(second, 0x80, 0x90);
        default:
            return isBetween(second, 0x80, 0xC0);
    }
}

/** Reads the character at the position and moves behind it. */
std::uint32_t readCharacter(const std::string& bytes, std::size_t& position) {
    const std::uint8_t first = byteAt(bytes, position++);
    if (first < 0x80) {
        return first;
    }
    const unsigned following = countFollowing(first);
    std::uint32_t character = first & (0x3FU >> following);
    for (unsigned index = 0; index < following; ++index) {
        if (position >= bytes.size()) {
            return REPLACEMENT;
        }
        const std::uint8_t next = byteAt(bytes, position);
        if (index == 0 ? !isSecond(first, next) : !isBetween(next, 0x80, 0xC0)) {
            return REPLACEMENT;
        }
        character = (character << 6U) | (next & 0x3FU);
        ++position;
    }
    return following > 0 ? character : REPLACEMENT;
}

void appendUtf8(std::string& bytes, std::uint32_t character) {
    const auto append = [&bytes](std::uint32_t value) {
        bytes.push_back(static_cast<char>(static_cast<std::uint8_t>(value)));
    };
    if (character < 0x80) {
        append(character);
        return;
    }
    if (character < 0x800) {
        append(0xC0U | (character >> 6U));
    } else if (character < SUPPLEMENTARY) {
        append(0xE0U | (character >> 12U));
        append(0x80U | ((character >> 6U) & 0x3FU));
    } else {
        append(0xF0U | (character >> 18U));
        append(0x80U | ((character >> 12U) & 0x3FU));
        append(0x80U | ((character >> 6U) & 0x3FU));
    }
    append(0x80U | (character & 0x3FU));
}

}  // namespace

Utf16 utf8ToUtf16(const std::string& bytes) {
    Utf16 units;
    units.reserve(bytes.size());
    std::size_t position = 0;
    while (position < bytes.size()) {
        std::uint32_t character = readCharacter(bytes, position);
        if (character >= SUPPLEMENTARY) {
            character -= SUPPLEMENTARY;
            units.push_back(static_cast<std::uint16_t>(HIGH_SURROGATE + (character >> 10U)));
            character = LOW_SURROGATE + (character & 0x3FFU);
        }
        units.push_back(static_cast<std::uint16_t>(character));
    }
    return units;
}

std::string utf16ToUtf8(const std::uint16_t* units, std::size_t count) {
    std::string bytes;
    bytes.reserve(count);
    for (std::size_t index = 0; index < count; ++index) {
        std::uint32_t character = units[index];
        if (isBetween(character, HIGH_SURROGATE, SURROGATE_END)) {
            const bool isPair = character < LOW_SURROGATE && index + 1 < count &&
                                isBetween(units[index + 1], LOW_SURROGATE, SURROGATE_END);
            character = isPair ? SUPPLEMENTARY + ((character - HIGH_SURROGATE) << 10U) +
                                     (units[++index] - LOW_SURROGATE)
                               : REPLACEMENT;
        }
        appendUtf8(bytes, character);
    }
    return bytes;
}

}  // namespace Jni
