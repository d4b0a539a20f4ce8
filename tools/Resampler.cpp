#include "tools/Resampler.h"

#include <speex/speex_resampler.h>

#include <algorithm>
#include <limits>
#include <stdexcept>
#include <string>

namespace Tools {

namespace {

constexpr std::size_t PIECE_SAMPLES = 1024;

}  // namespace

Resampler::Resampler(unsigned inputRateHz, unsigned outputRateHz)
    : inputRate(inputRateHz), outputRate(outputRateHz) {
    int failure = RESAMPLER_ERR_SUCCESS;
    if (inputRate != outputRate && inputRate > 0 && outputRate > 0) {
        state =
            speex_resampler_init(1, inputRate, outputRate, SPEEX_RESAMPLER_QUALITY_MAX, &failure);
    }
    if (state == nullptr && (inputRate != outputRate || inputRate == 0)) {
        throw std::invalid_argument("cannot convert sound from " + std::to_string(inputRate) +
                                    " Hz to " + std::to_string(outputRate) + " Hz");
    }
    if (state != nullptr) {
        // Without this the filter's delay would stand as silence before the sound.
        speex_resampler_skip_zeros(state);
    }
}

Resampler::~Resampler() {
    if (state != nullptr) {
        speex_resampler_destroy(state);
    }
}

void Resampler::write(const int16_t* samples, std::size_t count, std::vector<int16_t>& output) {
    if (state == nullptr) {
        output.insert(output.end(), samples, samples + count);
        return;
    }
    consumed += count;
    run(samples, count, std::numeric_limits<uint64_t>::max(), output);
}

void Resampler::finish(std::vector<int16_t>& output) {
    if (state == nullptr) {
        return;
    }
    const uint64_t total = (consumed * outputRate + inputRate / 2) / inputRate;
    const std::vector<int16_t> silence(PIECE_SAMPLES, 0);
    while (produced < total) {
        run(silence.data(), silence.size(), total, output);
    }
}

void Resampler::run(const int16_t* samples, std::size_t count, uint64_t limit,
                    std::vector<int16_t>& output) {
    int16_t buffer[PIECE_SAMPLES];
    while (count > 0 && produced < limit) {
        auto in = static_cast<spx_uint32_t>(std::min(count, PIECE_SAMPLES));
        auto out = static_cast<spx_uint32_t>(std::min<uint64_t>(limit - produced, PIECE_SAMPLES));
        if (speex_resampler_process_int(state, 0, samples, &in, buffer, &out) !=
            RESAMPLER_ERR_SUCCESS) {
            throw std::runtime_error("the resampler failed");
        }
        output.insert(output.end(), buffer, buffer + out);
        produced += out;
        samples += in;
        count -= in;
    }
}

}  // namespace Tools
