#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace Tools {

/** The bytes of a WAV file with 16-bit mono samples. */
std::string makeWav(const std::vector<int16_t>& samples, unsigned sampleRateHz);

}  // namespace Tools
