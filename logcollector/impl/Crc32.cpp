#include "logcollector/impl/Crc32.h"

#include <array>

namespace LogCollector {

namespace {

constexpr uint32_t POLYNOMIAL = 0xEDB88320;  // with its bits in reverse order

constexpr std::array<uint32_t, 256> makeTable() {
    std::array<uint32_t, 256> table{};
    for (uint32_t index = 0; index < table.size(); ++index) {
        uint32_t value = index;
        for (int bit = 0; bit < 8; ++bit) {
            value = (value & 1U) != 0 ? value >> 1U ^ POLYNOMIAL : value >> 1U;
        }
        table[index] = value;
    }
    return table;
}

constexpr std::array<uint32_t, 256> TABLE = makeTable();

}  // namespace

uint32_t crc32(std::string_view bytes, uint32_t sum) {
    sum = ~sum;
    for (const char byte : bytes) {
        sum = sum >> 8U ^ TABLE[(sum ^ static_cast<unsigned char>(byte)) & 0xFFU];
    }
    return ~sum;
}

}  // namespace LogCollector
