#pragma once

#include <cstdint>
#include <istream>
#include <string>
#include <vector>

namespace Cli {

/** The name that stands for sound on standard input. */
extern const char* const STANDARD_INPUT;

/** @throws UsageError if the engine does not take the rate */
void checkSampleRate(int sampleRateHz);

/**
 * The sound of a file, or a WAV file or raw sound from `input` when `path` is `STANDARD_INPUT`, as
 * 16-bit mono samples at the engine's rate. The log says when a file is cut.
 * @param maxSeconds the most to take from standard input
 * @throws UsageError when there is no sound or the rate is out of the engine's range
 */
std::vector<int16_t> loadSound(const std::string& path, std::istream& input, int sampleRateHz,
                               int maxSeconds);

/** Puts silence before the sound. @param milliseconds 0 or more */
void addLeadIn(std::vector<int16_t>& samples, int sampleRateHz, int milliseconds);

}  // namespace Cli
