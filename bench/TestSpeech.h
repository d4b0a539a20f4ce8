// Speech for the benchmarks: recorded test data where it is installed, else a synthetic stand-in.
#pragma once

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace Bench {

inline std::vector<int16_t> readRawSpeech(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    const std::vector<char> bytes((std::istreambuf_iterator<char>(file)), {});
    std::vector<int16_t> samples(bytes.size() / 2);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        samples[i] = static_cast<int16_t>(static_cast<unsigned char>(bytes[2 * i]) |
                                          static_cast<unsigned char>(bytes[2 * i + 1]) << 8);
    }
    return samples;
}

/** `seconds` of 16 kHz mono sound: recorded speech, repeated; a harmonic sound without it. */
inline std::vector<int16_t> testSpeech(std::size_t seconds) {
    std::vector<int16_t> source = readRawSpeech("/usr/share/pocketsphinx/test/data/goforward.raw");
    if (source.empty()) {
        for (int i = 0; i < 16000; ++i) {
            const double t = i / 16000.0;
            double value = 0;
            for (int harmonic = 1; harmonic < 12; ++harmonic) {
                value += std::sin(2 * M_PI * 140 * harmonic * t) / harmonic;
            }
            source.push_back(static_cast<int16_t>(4000 * value * (1 + std::sin(2 * M_PI * 4 * t))));
        }
    }
    std::vector<int16_t> samples(seconds * 16000);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        samples[i] = source[i % source.size()];
    }
    return samples;
}

}  // namespace Bench
