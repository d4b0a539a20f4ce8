/**
 * @file
 * The buffers that a recorder is asked for.
 */
#pragma once

#include <cstddef>
#include <cstdint>

#include "core/Export.h"
#include "core/sound/SoundDataInfo.h"

namespace Sound {

/** The buffers that a recorder is asked for: 16-bit mono of a rate and a length. */
class KORVEL_CORE_API RecorderFormat {
  public:
    /** Takes any values; `isUsable` says whether they can be recorded. */
    RecorderFormat(int sampleRateHz, int bufferLengthMs);

    /** False where no device could deliver this: rates outside 1 to 384 kHz, buffers outside
     * 1 ms to 10 s. Nothing else has a meaning then. */
    bool isUsable() const;

    /** Samples per buffer, rounded down. */
    int getSampleCount() const;

    /** Bytes per buffer. */
    std::size_t getByteCount() const;

    /** How long this many samples last, in nanoseconds, rounded down. */
    int64_t getDurationNs(int64_t sampleCount) const;

    /** The format of each buffer. */
    SoundDataInfo getInfo() const;

  private:
    int sampleRate;
    int bufferLength;
};

}  // namespace Sound
