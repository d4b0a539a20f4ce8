#pragma once

#include <vector>

namespace Cli {

/** Mono sound; the samples have the scale of 16-bit numbers, -32768 to 32767. */
struct AudioClip {
    std::vector<float> samples;
    int sampleRateHz = 0;

    double lengthS() const { return static_cast<double>(samples.size()) / sampleRateHz; }
};

/** Longest sound that is read, in seconds. */
const int MAX_CLIP_SECONDS = 3600;

}  // namespace Cli
