/**
 * @file
 * The check sum of stored records.
 */
#pragma once

#include <cstdint>
#include <string_view>

namespace LogCollector {

/** CRC-32 (IEEE 802.3) of `bytes`; `sum` is that of the bytes before them. */
uint32_t crc32(std::string_view bytes, uint32_t sum = 0);

}  // namespace LogCollector
