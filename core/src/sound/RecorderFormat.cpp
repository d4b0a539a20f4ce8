#include "core/sound/RecorderFormat.h"

#include "core/util/Time.h"

namespace Sound {

namespace {

const int SAMPLE_RATE_MIN = 1000;
const int SAMPLE_RATE_MAX = 384000;
const int BUFFER_LENGTH_MS_MIN = 1;
const int BUFFER_LENGTH_MS_MAX = 10000;
const int BYTES_PER_SAMPLE = 2;
const int MS_PER_SECOND = 1000;
using Util::NS_PER_S;

}  // namespace

RecorderFormat::RecorderFormat(int sampleRateHz, int bufferLengthMs)
    : sampleRate(sampleRateHz), bufferLength(bufferLengthMs) {}

bool RecorderFormat::isUsable() const {
    return sampleRate >= SAMPLE_RATE_MIN && sampleRate <= SAMPLE_RATE_MAX &&
           bufferLength >= BUFFER_LENGTH_MS_MIN && bufferLength <= BUFFER_LENGTH_MS_MAX;
}

int RecorderFormat::getSampleCount() const {
    return static_cast<int>(static_cast<int64_t>(sampleRate) * bufferLength / MS_PER_SECOND);
}

std::size_t RecorderFormat::getByteCount() const {
    return static_cast<std::size_t>(getSampleCount()) * BYTES_PER_SAMPLE;
}

int64_t RecorderFormat::getDurationNs(int64_t sampleCount) const {
    return sampleCount / sampleRate * NS_PER_S + sampleCount % sampleRate * NS_PER_S / sampleRate;
}

SoundDataInfo RecorderFormat::getInfo() const {
    return SoundDataInfo(SoundDataInfo::NONE, 1, sampleRate, BYTES_PER_SAMPLE, getSampleCount());
}

}  // namespace Sound
