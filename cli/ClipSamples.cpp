#include "ClipSamples.h"

#include <algorithm>
#include <cmath>
#include <stdexcept>

#include "UsageError.h"
#include "tools/Resampler.h"

namespace Cli {

namespace {

int16_t toInt16(float sample) {
    return static_cast<int16_t>(std::lround(std::min(32767.0f, std::max(-32768.0f, sample))));
}

/** A rate that no number of samples a second can be becomes 0, which no resampler takes. */
unsigned toRate(int sampleRateHz) {
    return sampleRateHz > 0 ? static_cast<unsigned>(sampleRateHz) : 0;
}

}  // namespace

std::vector<int16_t> toSamples(const AudioClip& clip, int sampleRateHz) {
    std::vector<int16_t> samples(clip.samples.size());
    std::transform(clip.samples.begin(), clip.samples.end(), samples.begin(), toInt16);
    try {
        Tools::Resampler resampler(toRate(clip.sampleRateHz), toRate(sampleRateHz));
        std::vector<int16_t> converted;
        resampler.write(samples.data(), samples.size(), converted);
        resampler.finish(converted);
        return converted;
    } catch (const std::invalid_argument& refused) {
        throw UsageError(refused.what());
    }
}

}  // namespace Cli
