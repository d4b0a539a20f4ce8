#include "SoundFiles.h"

#include <sndfile.h>

#include <cmath>

namespace TestSupport {

namespace {

const double TWO_PI = 6.283185307179586;

}  // namespace

bool writeSoundFile(const std::string& path, int format, int sampleRateHz, int channels,
                    const std::vector<int16_t>& samples) {
    SF_INFO info = {};
    info.format = format;
    info.samplerate = sampleRateHz;
    info.channels = channels;
    SNDFILE* file = sf_open(path.c_str(), SFM_WRITE, &info);
    if (file == nullptr) {
        return false;
    }
    const auto count = static_cast<sf_count_t>(samples.size());
    const bool complete = sf_write_short(file, samples.data(), count) == count;
    return sf_close(file) == 0 && complete;
}

std::vector<int16_t> sine(int sampleRateHz, double seconds, double frequencyHz, double amplitude) {
    std::vector<int16_t> samples(static_cast<std::size_t>(std::lround(sampleRateHz * seconds)));
    for (std::size_t index = 0; index < samples.size(); ++index) {
        const double time = static_cast<double>(index) / sampleRateHz;
        samples[index] =
            static_cast<int16_t>(std::lround(amplitude * std::sin(TWO_PI * frequencyHz * time)));
    }
    return samples;
}

std::vector<int16_t> voiceLike(int sampleRateHz, double seconds) {
    std::vector<int16_t> samples(static_cast<std::size_t>(std::lround(sampleRateHz * seconds)));
    uint32_t noise = 1;
    for (std::size_t index = 0; index < samples.size(); ++index) {
        const double time = static_cast<double>(index) / sampleRateHz;
        const double pitch = 140 + 20 * std::sin(TWO_PI * 3 * time);
        const double syllable = 0.55 + 0.45 * std::sin(TWO_PI * 4 * time);
        double value = 0;
        for (int harmonic = 1; harmonic <= 20; ++harmonic) {
            value += std::sin(TWO_PI * pitch * harmonic * time) / harmonic;
        }
        noise = noise * 1664525U + 1013904223U;
        const double hiss = static_cast<double>(noise >> 16U) / 65536.0 - 0.5;
        samples[index] = static_cast<int16_t>(std::lround(5000 * syllable * value + 20 * hiss));
    }
    return samples;
}

std::string rawBytes(const std::vector<int16_t>& samples) {
    std::string bytes;
    for (const int16_t sample : samples) {
        const auto value = static_cast<uint16_t>(sample);
        bytes += static_cast<char>(value & 0xFFU);
        bytes += static_cast<char>(value >> 8U);
    }
    return bytes;
}

}  // namespace TestSupport
