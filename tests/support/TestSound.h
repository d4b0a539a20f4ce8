/**
 * @file
 * Sound for tests: made by a formula, or recorded.
 */
#pragma once

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "core/sound/SoundDataBuffer.h"

namespace TestSupport {

using Samples = std::vector<int16_t>;

/** Reproducible noise between -1 and 1. */
class NoiseSource {
  public:
    explicit NoiseSource(uint32_t seed) : state(seed) {}

    float next() {
        state = state * 1664525U + 1013904223U;
        return static_cast<float>(state >> 8) / 8388608.0F - 1.0F;
    }

  private:
    uint32_t state;
};

/**
 * Sound with the shape of speech: syllables of harmonics under three moving resonances, a hiss now
 * and then, pauses of half a second, and a floor of noise.
 */
inline Samples makeSpeechLike(int sampleRateHz, int lengthMs, uint32_t seed = 1) {
    constexpr float PI = 3.14159265F;
    NoiseSource noise(seed);
    Samples samples(static_cast<std::size_t>(sampleRateHz) * static_cast<std::size_t>(lengthMs) /
                    1000);
    float phase = 0;
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const float t = static_cast<float>(i) / static_cast<float>(sampleRateHz);
        const float sentence = std::fmod(t, 2.0F) < 1.5F ? 1.0F : 0.0F;
        const float syllable = std::fmax(0.0F, std::sin(2 * PI * 4 * t));
        const float pitch = 120 + 30 * std::sin(2 * PI * 0.7F * t);
        phase += pitch / static_cast<float>(sampleRateHz);
        float voice = 0;
        for (int harmonic = 1; harmonic <= 25; ++harmonic) {
            const float frequency = static_cast<float>(harmonic) * pitch;
            const float first = (frequency - 500 - 200 * std::sin(2 * PI * 1.3F * t)) / 150;
            const float second = (frequency - 1500 - 400 * std::sin(2 * PI * 0.9F * t)) / 250;
            const float third = (frequency - 2500) / 300;
            const float gain = std::exp(-first * first) + 0.5F * std::exp(-second * second) +
                               0.25F * std::exp(-third * third);
            voice += gain * std::sin(2 * PI * static_cast<float>(harmonic) * phase);
        }
        const float hiss = std::fmod(t, 0.75F) > 0.68F ? noise.next() * 0.3F : 0.0F;
        const float value = sentence * (4000 * syllable * voice + 6000 * hiss) + 60 * noise.next();
        samples[i] = static_cast<int16_t>(std::fmax(-32000.0F, std::fmin(32000.0F, value)));
    }
    return samples;
}

/** Every sample `amplitude`, with alternating sign. */
inline Samples makeSquareWave(std::size_t count, int16_t amplitude) {
    Samples samples(count, amplitude);
    for (std::size_t i = 1; i < count; i += 2) {
        samples[i] = static_cast<int16_t>(-amplitude);
    }
    return samples;
}

/** Where the system's package of recorded test speech (16 kHz, 16-bit mono) keeps its files. */
inline std::string recordedSpeechPath(const std::string& name) {
    return "/usr/share/pocketsphinx/test/data/" + name;
}

/** Recorded speech without a header, 16-bit little-endian; empty when it is not installed. */
inline Samples loadRecordedSpeech(const std::string& name) {
    std::ifstream file(recordedSpeechPath(name), std::ios::binary);
    const std::vector<char> bytes{std::istreambuf_iterator<char>(file), {}};
    Samples samples(bytes.size() / 2);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const auto low = static_cast<unsigned char>(bytes[2 * i]);
        const auto high = static_cast<unsigned char>(bytes[2 * i + 1]);
        samples[i] = static_cast<int16_t>(low | high << 8);
    }
    return samples;
}

/** The same sound at twice or half the rate, crudely: good enough to compare detectors. */
inline Samples doubleRate(const Samples& samples) {
    Samples doubled;
    doubled.reserve(samples.size() * 2);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const int next = i + 1 < samples.size() ? samples[i + 1] : samples[i];
        doubled.push_back(samples[i]);
        doubled.push_back(static_cast<int16_t>((samples[i] + next) / 2));
    }
    return doubled;
}

inline Samples halveRate(const Samples& samples) {
    Samples halved(samples.size() / 2);
    for (std::size_t i = 0; i < halved.size(); ++i) {
        halved[i] = static_cast<int16_t>((samples[2 * i] + samples[2 * i + 1]) / 2);
    }
    return halved;
}

/** The little-endian bytes of `count` samples from `begin` on. */
inline std::vector<unsigned char> toBytes(const Samples& samples, std::size_t begin,
                                          std::size_t count) {
    std::vector<unsigned char> bytes;
    bytes.reserve(count * 2);
    for (std::size_t i = begin; i < begin + count; ++i) {
        const auto value = static_cast<uint16_t>(samples[i]);
        bytes.push_back(static_cast<unsigned char>(value & 0xFF));
        bytes.push_back(static_cast<unsigned char>(value >> 8));
    }
    return bytes;
}

/** A 16-bit mono buffer. */
inline Sound::SoundDataBuffer makeBuffer(const Samples& samples, int sampleRateHz) {
    const Sound::SoundDataInfo info(Sound::SoundDataInfo::NONE, 1, sampleRateHz, 2,
                                    static_cast<int>(samples.size()));
    return {info, toBytes(samples, 0, samples.size())};
}

/** The sound cut into 16-bit mono buffers of 100 ms, as a recorder delivers it; the rest dropped.
 */
inline std::vector<Sound::SoundDataBuffer> cutIntoBuffers(const Samples& samples,
                                                          int sampleRateHz) {
    const auto length = static_cast<std::size_t>(sampleRateHz / 10);
    const Sound::SoundDataInfo info(Sound::SoundDataInfo::NONE, 1, sampleRateHz, 2,
                                    static_cast<int>(length));
    std::vector<Sound::SoundDataBuffer> buffers;
    for (std::size_t begin = 0; begin + length <= samples.size(); begin += length) {
        buffers.emplace_back(info, toBytes(samples, begin, length));
    }
    return buffers;
}

}  // namespace TestSupport
