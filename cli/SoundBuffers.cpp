#include "SoundBuffers.h"

#include <algorithm>
#include <utility>

namespace Cli {

namespace {

const int SAMPLE_SIZE = 2;

}  // namespace

std::size_t bufferLength(int sampleRateHz) {
    return static_cast<std::size_t>(sampleRateHz) * BUFFER_MS / 1000;
}

Sound::SoundDataBuffer bufferAt(const std::vector<int16_t>& samples, std::size_t position,
                                std::size_t length, int sampleRateHz) {
    std::vector<unsigned char> bytes(length * SAMPLE_SIZE);
    const std::size_t end = std::min(samples.size(), position + length);
    for (std::size_t index = position; index < end; ++index) {
        const auto value = static_cast<uint16_t>(samples[index]);
        bytes[(index - position) * SAMPLE_SIZE] = static_cast<unsigned char>(value & 0xFFU);
        bytes[(index - position) * SAMPLE_SIZE + 1] = static_cast<unsigned char>(value >> 8U);
    }
    return Sound::SoundDataBuffer(Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 1, sampleRateHz,
                                                       SAMPLE_SIZE, static_cast<int>(length)),
                                  std::move(bytes));
}

void appendSamples(std::vector<int16_t>& samples, const Sound::SoundDataBuffer& buffer) {
    const std::vector<unsigned char>& bytes = buffer.getData();
    for (std::size_t index = 0; index + 1 < bytes.size(); index += SAMPLE_SIZE) {
        const auto value = static_cast<uint16_t>(bytes[index] | bytes[index + 1] << 8U);
        samples.push_back(static_cast<int16_t>(value));
    }
}

}  // namespace Cli
