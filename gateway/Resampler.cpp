#include "gateway/Resampler.h"

#include <speex/speex_resampler.h>

#include <algorithm>
#include <new>

namespace Gateway {

namespace {

constexpr int QUALITY = 6;

}  // namespace

Resampler::Resampler(unsigned inputRateHz, unsigned outputRateHz)
    : inputRate(inputRateHz), outputRate(outputRateHz) {
    if (inputRate == outputRate) {
        return;
    }
    int failure = RESAMPLER_ERR_SUCCESS;
    state = speex_resampler_init(1, inputRate, outputRate, QUALITY, &failure);
    if (state == nullptr) {
        throw std::bad_alloc();
    }
    speex_resampler_skip_zeros(state);
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
    run(samples, count, output);
}

void Resampler::finish(std::vector<int16_t>& output) {
    if (state == nullptr) {
        return;
    }
    const uint64_t total = consumed * outputRate / inputRate;
    const std::vector<int16_t> silence(
        static_cast<std::size_t>(speex_resampler_get_input_latency(state)) + 1, 0);
    run(silence.data(), silence.size(), output);
    if (produced > total) {
        const uint64_t excess = std::min<uint64_t>(produced - total, output.size());
        output.resize(output.size() - static_cast<std::size_t>(excess));
    }
}

void Resampler::run(const int16_t* samples, std::size_t count, std::vector<int16_t>& output) {
    constexpr std::size_t PIECE = 1024;
    int16_t buffer[PIECE];
    while (count > 0) {
        spx_uint32_t in = static_cast<spx_uint32_t>(std::min(count, PIECE));
        spx_uint32_t out = PIECE;
        speex_resampler_process_int(state, 0, samples, &in, buffer, &out);
        output.insert(output.end(), buffer, buffer + out);
        produced += out;
        samples += in;
        count -= in;
    }
}

}  // namespace Gateway
