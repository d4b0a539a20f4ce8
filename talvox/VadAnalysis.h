/**
 * @file
 * What the voice activity detector makes of given sound, for those who tune the "vad" setting.
 */
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "core/sound/FileRecorder.h"
#include "core/sound/Recorder.h"
#include "core/sound/SoundDataBuffer.h"
#include "talvox/Export.h"

namespace Talvox {

/** What a session with the same sound does after a buffer. */
enum class ListeningStep {
    /** Nothing; it goes on listening. */
    GO_ON,
    /** The noise is learnt: `onRecordingBegin`. */
    RECORDING_BEGINS,
    /** `onSpeakingBegin` */
    SPEECH_BEGINS,
    /** Speech has ended, or there were more than 20 s of sound: the recording ends and is sent. */
    LISTENING_ENDS,
    /** 5 s without speech: the session ends with `ErrorNoVoice`. */
    NO_VOICE
};

/** What the detector made of one buffer. */
struct VadBufferAnalysis {
    /** Where the buffer begins and ends: sound time in ms from the first buffer, rounded down. */
    int64_t startMs = 0;
    int64_t endMs = 0;
    /** When the buffer arrives: ms since the session's start, rounded down. */
    int64_t arrivalMs = 0;
    /** After `LISTENING_ENDS` or `NO_VOICE` a session listens no longer; the analysis goes on. */
    ListeningStep step = ListeningStep::GO_ON;
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
    /**
     * Sound level in dB, as listeners are notified of it: smoothed over the buffers since the
     * leading noise, above -60.3 dB of full scale (a mean square of 1000), or in general mode above
     * the learnt noise. During the leading noise the level of all noise so far that the detector
     * goes by, above -45.3 dB of full scale. 0 before the first sample that is not zero.
     */
    float level = 0;
    /** Every sample of the buffer is zero. `level` may still fall, or be any negative number. */
    bool isDigitalSilence = false;
    /** The detector's state after the buffer. */
    bool isSpeech = false;
};

/**
 * A stretch of speech in sound time, from the end of the buffer that began it to the end of that
 * which ended it.
 */
struct VadSegment {
    /** In ms. */
    int64_t startMs = 0;
    int64_t endMs = 0;
};

/**
 * Runs a detector over sound and shows what a session does when a `Sound::FileRecorder` plays that
 * sound to it. Both go by the same rules; the analysis goes on where a session stops listening.
 *
 * A buffer arrives the device's delay after its last sample. The detector learns from each buffer
 * up to the first one that arrives more than its leading noise (200 ms) after the start. With
 * buffers of 100 ms and a delay of 2 to 100 ms that is the second buffer, at every rate. At 11,025
 * Hz a buffer has 1102 samples: two buffers last 199 whole ms and, with a delay of 20 ms, have
 * arrived after 219 ms. There the 203rd buffer exceeds 20 s of sound, since each counts as 99 ms;
 * at multiples of 10 Hz it is the 201st.
 *
 * Used by one thread at a time; never blocks, needs no event thread.
 */
class TALVOX_API VadAnalyzer {
  public:
    /**
     * @param vadParameters the "vad" setting; mistakes in it are logged, an unknown engine name
     *                      also raises an assertion
     * @param sampleRateHz  rate of the sound; real decisions need 8000, 16000 or 32000
     * @param mode          as a session's, decides between relative (general) and absolute level
     * @param deviceDelayMs milliseconds from a buffer's last sample to its arrival
     */
    VadAnalyzer(const std::string& vadParameters, int sampleRateHz,
                Sound::Recorder::Mode mode = Sound::Recorder::MODE_VOICE_RECOGNITION,
                int deviceDelayMs = Sound::FileRecorder::DEVICE_DELAY_MS_DFLT);
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
