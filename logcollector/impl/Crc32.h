/**
 * @file
 * The check sum of stored records.
 */
#pragma once

#include <boost/crc.hpp>
#include <cstdint>
#include <initializer_list>
#include <string_view>

namespace LogCollector {

/** CRC-32 (IEEE 802.3) of the parts, one after the other. */
inline uint32_t crc32(std::initializer_list<std::string_view> parts) {
    boost::crc_32_type sum;
    for (const std::string_view part : parts) {
        sum.process_bytes(part.data(), part.size());
    }
    return sum.checksum();
}

}  // namespace LogCollector
