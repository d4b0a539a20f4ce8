#include "talvox/impl/VoicePowerEstimator.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <vector>

#include "pal/kd_assert.h"
#include "pal/kd_log.h"

namespace {

// Divisions by an empty buffer's length rely on it.
static_assert(std::numeric_limits<float>::is_iec559, "NaN and infinity are part of the levels");

/** Claimed samples of all channels. */
int countSamples(const Sound::SoundDataBuffer& buffer) {
    return static_cast<int>(static_cast<unsigned>(buffer.getSampleCount()) *
                            static_cast<unsigned>(buffer.getInfo().getChannelCount()));
}

/** Claimed samples of all channels, as far as the buffer has them. */
std::size_t countPresentSamples(const Sound::SoundDataBuffer& buffer, std::size_t sampleSize) {
    const int64_t claimed = static_cast<int64_t>(buffer.getSampleCount()) *
                            static_cast<int64_t>(buffer.getInfo().getChannelCount());
    if (claimed <= 0) {
        return 0;
    }
    const std::size_t present = buffer.getData().size() / sampleSize;
    return static_cast<uint64_t>(claimed) < present ? static_cast<std::size_t>(claimed) : present;
}

/** Sum of squares of the first `count` samples, which `sampleAt(index)` gives. */
template <typename SampleAt>
float sumSquares(std::size_t count, SampleAt sampleAt) {
    float sum = 0;
    for (std::size_t i = 0; i < count; ++i) {
        const int sample = sampleAt(i);
        sum += static_cast<float>(sample * sample);
    }
    return sum;
}

float decibels(float energy) {
    return 10.0F * log10f(energy);
}

}  // namespace

namespace Talvox {

float VoicePowerEstimator::getEnergy(const Sound::SoundDataBuffer& buffer) const {
    const unsigned char* bytes = buffer.getData().data();
    switch (buffer.getInfo().getSampleSize()) {
        case 1:
            return sumSquares(countPresentSamples(buffer, 1), [bytes](std::size_t i) {
                return static_cast<int>(static_cast<int8_t>(bytes[i]));
            });
        case 2:
            return sumSquares(countPresentSamples(buffer, 2), [bytes](std::size_t i) {
                return static_cast<int>(static_cast<int16_t>(bytes[2 * i] | bytes[2 * i + 1] << 8));
            });
        default:
            kdLogFormatMessage("%s: unknown sample size %d", "getEnergy",
                               buffer.getInfo().getSampleSize());
            return 0;
    }
}

void VoicePowerEstimator::learnNoise(const Sound::SoundDataBuffer& buffer) {
    const float energy = getEnergy(buffer);
    noiseSamples = static_cast<int>(static_cast<unsigned>(noiseSamples) +
                                    static_cast<unsigned>(countSamples(buffer)));
    noiseEnergy += energy;
    if (noiseEnergy == 0) {
        noiseLevel = 0;
        return;
    }
    noiseLevel = decibels(noiseEnergy / static_cast<float>(buffer.getSampleCount())) - 45.0F;
}

void VoicePowerEstimator::updatePower(const Sound::SoundDataBuffer& buffer) {
    const float mean = getEnergy(buffer) / static_cast<float>(countSamples(buffer));
    power = mean * WEIGHT_NEW_ENERGY + power * (1.0F - WEIGHT_NEW_ENERGY);
    if (power == 0) {
        level = 0;
        return;
    }
    switch (mode) {
        case 0:
            level = decibels(power) - 45.0F - noiseLevel;
            return;
        case 1:
            level = decibels(power) - 30.0F;
            return;
        default:
            KOR_ASSERT_AT(false, "false", "talvox/impl/VoicePowerEstimator", 81);
    }
}

}  // namespace Talvox
