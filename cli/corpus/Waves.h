/**
 * @file
 * Arithmetic of the generated corpus. It gives the same bits on every machine: it is made of the
 * operations that IEEE 754 rounds exactly (+, -, *, / and square roots) and calls nothing else of
 * the mathematical library. These sources are compiled without contraction of products and sums.
 */
#pragma once

#include <cstdint>
#include <vector>

namespace Cli {

/** Sound between the steps of its generation; the scale is that of 16-bit samples. */
using Wave = std::vector<double>;

/** The sample rate at which the corpus is generated. */
const int WAVE_RATE_HZ = 16000;

/** The sine of a whole circle times `turns`, which is 0 or more. */
double sineOfTurns(double turns);

/** The root of the mean square; 0 for no samples. */
double rms(const Wave& wave, std::size_t begin, std::size_t end);
double rms(const Wave& wave);

void scale(Wave& wave, double gain);

/** Half the rate, without what the new rate cannot hold. */
Wave halveRate(const Wave& wave);

/** Rounded to the nearest sample; what does not fit is cut off. */
std::vector<int16_t> toSamples(const Wave& wave);

}  // namespace Cli
