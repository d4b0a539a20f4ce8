/**
 * @file
 * The frame detector over WebRTC's.
 */
#pragma once

#include <string>

#include "libs/webrtc_vad.h"
#include "talvox/impl/FrameVAD.h"
#include "talvox/impl/VoicePowerEstimator.h"

/** Equal in all four fields. */
bool operator==(const WebRtc_ModeParams& left, const WebRtc_ModeParams& right);

namespace Talvox {

/**
 * Asks the WebRTC detector about each frame of 16-bit mono sound, and tunes it to the level of the
 * leading noise unless thresholds were set explicitly.
 *
 * Rates of 8, 16 and 32 kHz and frames of 10, 20 and 30 ms give real decisions; everything else
 * the library refuses, and a refused frame counts as speech.
 */
class VoiceActivityDetectorWebRTC : public FrameVAD {
  public:
    static constexpr int AGGRESSIVENESS_DFLT = 2;
    static constexpr int FRAME_MS_DFLT = 10;
    static constexpr int LEADING_NOISE_MS_DFLT = 200;

    /** Thresholds from a level of the leading noise on. */
    struct NoiseRow {
        float noiseLevelDb;
        WebRtc_ModeParams params;
    };
    /** From the highest level down: the louder the noise, the stricter the thresholds. */
    static constexpr NoiseRow NOISE_ROWS[] = {
        {12.0F, {98, 1200, 5, 8}},
        {9.0F, {97, 1150, 6, 9}},
        {7.0F, {95, 1100, 6, 9}},
    };

    ~VoiceActivityDetectorWebRTC() override;

    void setSoundDataInfo(const Sound::SoundDataInfo& format) override;
    void setSessionMode(Sound::Recorder::Mode mode) override;
    int getLeadingNoiseMS() const override;
    void start() override;
    void processNoise(const Sound::SoundDataBuffer& buffer) override;
    int getNoiseRow() const override { return noiseRow; }
    void cancel() override;
    void setParameter(const std::string& name, const std::string& value) override;
    unsigned getFrameSizeInBytes() const override;
    bool processFrame(const unsigned char* frame) override;

    /** Gives the library's instance back. */
    void stop();

  private:
    bool hasModeParams() const;

    int aggressiveness = AGGRESSIVENESS_DFLT;
    int frameMs = FRAME_MS_DFLT;
    VoicePowerEstimator powerEstimator;
    WebRtc_ModeParams modeParams = {};
    int verboseLevel = 0;
    Sound::Recorder::Mode sessionMode = Sound::Recorder::MODE_VOICE_RECOGNITION;
    Sound::SoundDataInfo info;
    bool isStarted = false;
    int noiseRow = -1;
    int leadingNoiseMs = LEADING_NOISE_MS_DFLT;
    VadInst* handle = nullptr;
};

}  // namespace Talvox
