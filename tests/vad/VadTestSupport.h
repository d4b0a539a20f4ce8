/**
 * @file
 * Detectors and sound for the tests of the detectors.
 */
#pragma once

#include <cstddef>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "support/TestSound.h"
#include "talvox/impl/FrameVAD.h"

namespace TestSupport {

/** `makeSpeechLike`, made once per rate and length. */
inline const Samples& speechLike(int sampleRateHz, int lengthMs) {
    static std::map<std::pair<int, int>, Samples> made;
    Samples& samples = made[{sampleRateHz, lengthMs}];
    if (samples.empty()) {
        samples = makeSpeechLike(sampleRateHz, lengthMs);
    }
    return samples;
}

/** 16-bit mono without a claimed sample count. */
inline Sound::SoundDataInfo monoFormat(int sampleRateHz) {
    return {Sound::SoundDataInfo::NONE, 1, sampleRateHz, 2};
}

/** Says that a frame is speech when its first byte is not 0, and notes what it was asked. */
class ScriptedFrameVAD : public Talvox::FrameVAD {
  public:
    explicit ScriptedFrameVAD(unsigned sizeInBytes = 320) : size(sizeInBytes), step(sizeInBytes) {}

    void setSoundDataInfo(const Sound::SoundDataInfo& format) override {
        calls.push_back("setSoundDataInfo " + std::to_string(format.getSampleRate()));
    }
    void setSessionMode(Sound::Recorder::Mode mode) override {
        calls.push_back("setSessionMode " + std::to_string(mode));
    }
    int getLeadingNoiseMS() const override { return 123; }
    void start() override { calls.push_back("start"); }
    void processNoise(const Sound::SoundDataBuffer& buffer) override {
        calls.push_back("processNoise " + std::to_string(buffer.getData().size()));
    }
    void cancel() override { calls.push_back("cancel"); }
    void setParameter(const std::string& name, const std::string& value) override {
        calls.push_back(name + "=" + value);
    }
    unsigned getFrameSizeInBytes() const override { return size; }
    unsigned getFrameStepInBytes() const override { return step; }
    bool processFrame(const unsigned char* frame) override {
        firstBytes.push_back(frame[0]);
        return frame[0] != 0;
    }

    unsigned size;
    unsigned step;
    std::vector<std::string> calls;
    /** First byte of every frame it was asked about. */
    std::vector<int> firstBytes;
};

/** A 16 kHz buffer of 320-byte frames of 10 ms that begin with the given bytes. */
inline Sound::SoundDataBuffer makeMarkedBuffer(const std::vector<int>& firstBytes,
                                               std::size_t bytesBehind = 0) {
    std::vector<unsigned char> bytes(firstBytes.size() * 320 + bytesBehind, 0);
    for (std::size_t i = 0; i < firstBytes.size(); ++i) {
        bytes[i * 320] = static_cast<unsigned char>(firstBytes[i]);
    }
    const Sound::SoundDataInfo info(Sound::SoundDataInfo::NONE, 1, 16000, 2,
                                    static_cast<int>(bytes.size() / 2));
    return {info, std::move(bytes)};
}

}  // namespace TestSupport
