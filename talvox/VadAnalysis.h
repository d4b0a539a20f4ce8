/**
 * @file
 * What the voice activity detector makes of given sound, for those who tune the "vad" setting.
 */
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "core/sound/Recorder.h"
#include "core/sound/SoundDataBuffer.h"
#include "talvox/Export.h"

namespace Talvox {

/** What the detector made of one buffer. Times are sound time in ms from the first buffer. */
struct VadBufferAnalysis {
    int64_t startMs = 0;
    int64_t endMs = 0;
    /** The buffer belongs to the leading noise: there are no decisions, and no speech. */
    bool learningNoise = false;
    /** One per frame of the buffer that was looked at, in order; true for speech. */
    std::vector<bool> decisions;
    /**
     * The share of speech frames, 0 to 1, that was set against the threshold: over the on-span
     * while speech was off before the buffer, else over the off-span. With the bare frame engine
     * the share in this buffer. NaN where there are no frames.
     */
    float activity = 0;
    /** Sound level in dB, as listeners are told; during the leading noise the noise's level. */
    float level = 0;
    /** The detector's state after the buffer. */
    bool isSpeech = false;
};

/** A stretch of speech, from the end of the buffer that began it to the end of that which ended it.
 */
struct VadSegment {
    int64_t startMs = 0;
    int64_t endMs = 0;
};

/**
 * Runs a detector over sound just as a recognition session does, and goes on where a session would
 * stop listening. Used by one thread at a time; never blocks, needs no event thread.
 */
class TALVOX_API VadAnalyzer {
  public:
    /**
     * @param vadParameters the "vad" setting; mistakes in it are logged, an unknown engine name
     *                      also raises an assertion
     * @param sampleRateHz  rate of the sound; real decisions need 8000, 16000 or 32000
     * @param mode          as a session's, decides between relative (general) and absolute level
     */
    VadAnalyzer(const std::string& vadParameters, int sampleRateHz,
                Sound::Recorder::Mode mode = Sound::Recorder::MODE_VOICE_RECOGNITION);
    ~VadAnalyzer();
    VadAnalyzer(const VadAnalyzer&) = delete;
    VadAnalyzer& operator=(const VadAnalyzer&) = delete;

    /**
     * Looks at the next buffer, of 16-bit mono sound at the rate given. A session's buffers are
     * 100 ms long; other lengths change what the detector finds.
     */
    VadBufferAnalysis analyze(const Sound::SoundDataBuffer& buffer);

    /** All speech so far, in order; a stretch that has not ended yet ends at the last buffer. */
    std::vector<VadSegment> segments() const;

  private:
    struct Impl;
    std::unique_ptr<Impl> impl;
};

}  // namespace Talvox
