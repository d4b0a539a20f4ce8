#pragma once

#include <cstdint>
#include <vector>

#include "AudioFile.h"

namespace Cli {

/**
 * The clip as 16-bit samples at another rate: N samples become N x rate / clip rate, rounded to
 * the nearest. At the clip's own rate 16-bit sound comes out bit for bit as it went in.
 * @throws UsageError when the rates cannot be converted into each other
 */
std::vector<int16_t> toSamples(const AudioClip& clip, int sampleRateHz);

}  // namespace Cli
