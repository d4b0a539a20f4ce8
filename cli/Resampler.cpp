#include "Resampler.h"

#include <speex/speex_resampler.h>

#include <algorithm>
#include <cmath>
#include <memory>
#include <string>

#include "UsageError.h"

namespace Cli {

namespace {

const std::size_t BLOCK_SAMPLES = 4096;

using Resampler = std::unique_ptr<SpeexResamplerState, void (*)(SpeexResamplerState*)>;

[[noreturn]] void refuse(int fromHz, int toHz) {
    throw UsageError("cannot convert sound from " + std::to_string(fromHz) + " Hz to " +
                     std::to_string(toHz) + " Hz");
}

Resampler makeResampler(int fromHz, int toHz) {
    int error = RESAMPLER_ERR_SUCCESS;
    SpeexResamplerState* state = nullptr;
    if (fromHz > 0 && toHz > 0) {
        state = speex_resampler_init(1, static_cast<spx_uint32_t>(fromHz),
                                     static_cast<spx_uint32_t>(toHz), SPEEX_RESAMPLER_QUALITY_MAX,
                                     &error);
    }
    if (state == nullptr) {
        refuse(fromHz, toHz);
    }
    // Without this the filter's delay would stand as silence before the sound.
    speex_resampler_skip_zeros(state);
    return Resampler(state, &speex_resampler_destroy);
}

/** Feeds the clip and then silence until `length` samples have come out. */
std::vector<float> resample(const AudioClip& clip, int toHz, std::size_t length) {
    const Resampler resampler = makeResampler(clip.sampleRateHz, toHz);
    const std::vector<float> silence(BLOCK_SAMPLES, 0.0f);
    std::vector<float> output(length);
    std::size_t read = 0;
    std::size_t written = 0;
    while (written < length) {
        const bool sound = read < clip.samples.size();
        const float* input = sound ? &clip.samples[read] : silence.data();
        auto inputLength = static_cast<spx_uint32_t>(
            std::min(BLOCK_SAMPLES, sound ? clip.samples.size() - read : silence.size()));
        auto outputLength = static_cast<spx_uint32_t>(std::min(BLOCK_SAMPLES, length - written));
        if (speex_resampler_process_float(resampler.get(), 0, input, &inputLength, &output[written],
                                          &outputLength) != RESAMPLER_ERR_SUCCESS) {
            refuse(clip.sampleRateHz, toHz);
        }
        read += sound ? inputLength : 0;
        written += outputLength;
    }
    return output;
}

int16_t toInt16(float sample) {
    return static_cast<int16_t>(std::lround(std::min(32767.0f, std::max(-32768.0f, sample))));
}

}  // namespace

std::vector<int16_t> toSamples(const AudioClip& clip, int sampleRateHz) {
    std::vector<int16_t> samples(clip.samples.size());
    if (clip.sampleRateHz == sampleRateHz) {
        std::transform(clip.samples.begin(), clip.samples.end(), samples.begin(), toInt16);
        return samples;
    }
    const double length =
        static_cast<double>(clip.samples.size()) * sampleRateHz / clip.sampleRateHz;
    const std::vector<float> converted =
        resample(clip, sampleRateHz, static_cast<std::size_t>(std::max(0L, std::lround(length))));
    samples.resize(converted.size());
    std::transform(converted.begin(), converted.end(), samples.begin(), toInt16);
    return samples;
}

}  // namespace Cli
