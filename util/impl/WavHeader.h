/**
 * @file
 * Layout of a WAV file's header.
 */
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "core/sound/SoundDataInfo.h"

namespace Util {

/** The 44 bytes before the samples; all numbers little-endian, whatever the machine. */
class WavHeader {
  public:
    static constexpr std::size_t SIZE = 44;
    /** Offsets of the two lengths. */
    static constexpr int CHUNK_SIZE_OFFSET = 4;
    static constexpr int DATA_SIZE_OFFSET = 40;

    using Bytes = std::array<std::uint8_t, SIZE>;
    using Number = std::array<std::uint8_t, 4>;

    /** A header with both lengths 0. */
    static Bytes build(const Sound::SoundDataInfo& info);

    static Number littleEndian(std::uint32_t value);

    /** The chunk length for so many sample bytes; the largest number where it does not fit. */
    static std::uint32_t chunkSize(std::uint32_t dataBytes);

    /** `dataBytes` after so many more, 1 or above; the largest number where it does not fit. */
    static std::uint32_t grow(std::uint32_t dataBytes, int written);
};

}  // namespace Util
