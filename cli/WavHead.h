#pragma once

#include <cstdint>
#include <istream>
#include <optional>

namespace Cli {

/** What the header of a WAV file says about the sound behind it. */
struct WavHead {
    std::uint64_t soundOffset = 0;    /**< where the bytes of the sound begin */
    std::uint64_t soundBytes = 0;     /**< how many there are, unless `isOpenEnded` */
    std::uint32_t bytesPerSecond = 0; /**< 0 if the header does not say */
    bool isOpenEnded = false;         /**< written into a pipe, before the length was known */
};

/**
 * Reads the header of a WAV file from the beginning of a stream that can seek. The stream's
 * position and state are undefined afterwards.
 * @return nothing if the stream holds no WAV file, or ends before its sound begins
 */
std::optional<WavHead> readWavHead(std::istream& in);

}  // namespace Cli
