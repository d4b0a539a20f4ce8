/**
 * @file
 * What a session does after each buffer.
 */
#pragma once

#include <cstdint>

#include "core/sound/SoundDataBuffer.h"
#include "talvox/VadAnalysis.h"

namespace Talvox {

/**
 * The rules by which a session reads time, sound and detector. They are here once, for the session
 * and for `VadAnalyzer`, which shows what a session does.
 */
class ListeningRules {
  public:
    /** Length of the buffers that a session asks its recorder for. */
    static constexpr int BUFFER_LENGTH_MS = 100;

    /** Whole milliseconds of a buffer's sound; 0 where it claims no samples or has no rate. */
    static unsigned getDurationMs(const Sound::SoundDataBuffer& buffer);

    /**
     * Whether the buffer that arrives now is the last that the detector learns from.
     * @param sinceStartNs   nanoseconds on the clock since the session's start
     * @param leadingNoiseMs what the detector asks for
     */
    static bool isNoiseLearned(int64_t sinceStartNs, unsigned leadingNoiseMs);

    /**
     * The step after a buffer behind the leading noise.
     * @param wasSpeech    the detector's state before the buffer
     * @param isSpeech     its state after the buffer
     * @param recordedMs   the sum of `getDurationMs` of all buffers, this one and the leading noise
     *                     included
     * @param sinceStartNs nanoseconds on the clock since the session's start
     */
    static ListeningStep decide(bool wasSpeech, bool isSpeech, unsigned recordedMs,
                                int64_t sinceStartNs);
};

}  // namespace Talvox
