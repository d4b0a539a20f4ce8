/**
 * @file
 * The default detector.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <string>

#include "talvox/impl/DecisionHistory.h"
#include "talvox/impl/FrameVAD.h"

namespace Talvox {

/**
 * Smooths the decisions of a frame detector: speech switches on when more than a share of the last
 * frames is speech, and off when, after a minimal time, less than another share is.
 */
class BufferedVAD : public VoiceActivityDetector {
  public:
    static constexpr unsigned ANALYZE_MS_ON_DFLT = 400;
    static constexpr unsigned ANALYZE_MS_OFF_DFLT = 1000;
    static constexpr float ACTIVITY_ON_DFLT = 0.5F;
    static constexpr float ACTIVITY_OFF_DFLT = 0.25F;
    static constexpr unsigned MIN_VOICE_TIME_MS_DFLT = 500;

    /** Longest history in frames (8 MB); longer spans are cut to it, with a log line. */
    static constexpr unsigned HISTORY_FRAMES_MAX = 64U * 1024 * 1024;

    /** The most frames that `dumpFrames` writes out: more than ten minutes of them. */
    static constexpr unsigned DUMPED_FRAMES_MAX = 64U * 1024;

    explicit BufferedVAD(const boost::shared_ptr<FrameVAD>& frameDetector);

    void setSoundDataInfo(const Sound::SoundDataInfo& format) override;
    void setSessionMode(Sound::Recorder::Mode mode) override;
    int getLeadingNoiseMS() const override;
    /**
     * Turns the spans into frames; where a frame is shorter than a millisecond, or the format is
     * not known, they become 0 and speech is never found.
     */
    void start() override;
    void processNoise(const Sound::SoundDataBuffer& buffer) override;
    void process(const Sound::SoundDataBuffer& buffer) override;
    bool isSpeech() const override;
    float getLatestActivity() const override;
    int getNoiseRow() const override;
    void cancel() override;
    void setParameter(const std::string& name, const std::string& value) override;

    /**
     * Logs the share of speech in the history, and the history, oldest first. Of a history longer
     * than `DUMPED_FRAMES_MAX` only the newest frames are written out: this runs once a buffer.
     */
    void dumpFrames() const;

    /**
     * Share of speech frames in the span that is examined while speech is on, or off; NaN for an
     * empty span.
     */
    float getActivity(bool whileSpeechIsOn) const;

    /** Decisions of the last frames, oldest first. */
    const DecisionHistory& getHistory() const { return frames; }

  private:
    void decideFrames(const Sound::SoundDataBuffer& buffer);
    void lookForSpeech();
    void lookForSilence(const Sound::SoundDataBuffer& buffer);

    boost::shared_ptr<FrameVAD> frameVad;
    Sound::SoundDataInfo info;
    unsigned analyzeMsOn = ANALYZE_MS_ON_DFLT;
    unsigned nFramesOn = 0;
    float activityOn = ACTIVITY_ON_DFLT;
    unsigned analyzeMsOff = ANALYZE_MS_OFF_DFLT;
    unsigned nFramesOff = 0;
    float activityOff = ACTIVITY_OFF_DFLT;
    unsigned minVoiceTimeMs = MIN_VOICE_TIME_MS_DFLT;
    DecisionHistory frames;
    bool speech = false;
    bool wasSpeech = false;
    unsigned msSinceSpeechStart = 0;
    int verboseLevel = 0;
};

}  // namespace Talvox
