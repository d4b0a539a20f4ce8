#include "Waves.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace Cli {

namespace {

const double TWO_PI = 6.283185307179586;

const int FILTER_HALF = 31;
const int FILTER_TAPS = 2 * FILTER_HALF + 1;
// In parts of the higher rate: a little below the half of the lower one.
const double CUTOFF = 0.23;

/** The sine of an angle from 0 to a right one, by its series. */
double sineOfQuarter(double radians) {
    const double square = radians * radians;
    double term = radians;
    double sum = radians;
    for (int factor = 2; factor <= 18; factor += 2) {
        term = -term * square / (factor * (factor + 1));
        sum += term;
    }
    return sum;
}

double cosineOfTurns(double turns) {
    return sineOfTurns(turns + 0.25);
}

/** A low pass: the ideal one's response under a Blackman window, with a sum of 1. */
std::array<double, FILTER_TAPS> makeLowPass() {
    std::array<double, FILTER_TAPS> taps = {};
    double sum = 0;
    for (int index = 0; index < FILTER_TAPS; ++index) {
        const int distance = index < FILTER_HALF ? FILTER_HALF - index : index - FILTER_HALF;
        const double ideal = distance == 0 ? 2 * CUTOFF
                                           : 2 * sineOfTurns(CUTOFF * distance) /
                                                 (TWO_PI * static_cast<double>(distance));
        const double place = static_cast<double>(index) / (FILTER_TAPS - 1);
        const double window = 0.42 - 0.5 * cosineOfTurns(place) + 0.08 * cosineOfTurns(2 * place);
        taps[static_cast<std::size_t>(index)] = ideal * window;
        sum += ideal * window;
    }
    for (double& tap : taps) {
        tap /= sum;
    }
    return taps;
}

}  // namespace

double sineOfTurns(double turns) {
    double part = turns - static_cast<double>(static_cast<int64_t>(turns));
    const bool isNegative = part >= 0.5;
    part -= isNegative ? 0.5 : 0.0;
    part = part > 0.25 ? 0.5 - part : part;
    const double sine = sineOfQuarter(part * TWO_PI);
    return isNegative ? -sine : sine;
}

double rms(const Wave& wave, std::size_t begin, std::size_t end) {
    double sum = 0;
    for (std::size_t index = begin; index < end; ++index) {
        sum += wave[index] * wave[index];
    }
    return end > begin ? std::sqrt(sum / static_cast<double>(end - begin)) : 0;
}

double rms(const Wave& wave) {
    return rms(wave, 0, wave.size());
}

void scale(Wave& wave, double gain) {
    for (double& sample : wave) {
        sample *= gain;
    }
}

Wave halveRate(const Wave& wave) {
    static const std::array<double, FILTER_TAPS> taps = makeLowPass();
    const auto size = static_cast<std::ptrdiff_t>(wave.size());
    Wave halved(wave.size() / 2);
    for (std::size_t index = 0; index < halved.size(); ++index) {
        const std::ptrdiff_t begin = 2 * static_cast<std::ptrdiff_t>(index) - FILTER_HALF;
        double sum = 0;
        for (std::ptrdiff_t tap = 0; tap < FILTER_TAPS; ++tap) {
            const std::ptrdiff_t place = begin + tap;
            if (place >= 0 && place < size) {
                sum += taps[static_cast<std::size_t>(tap)] * wave[static_cast<std::size_t>(place)];
            }
        }
        halved[index] = sum;
    }
    return halved;
}

std::vector<int16_t> toSamples(const Wave& wave) {
    std::vector<int16_t> samples(wave.size());
    std::transform(wave.begin(), wave.end(), samples.begin(), [](double value) {
        const double cut = std::min(32767.0, std::max(-32768.0, value));
        return static_cast<int16_t>(cut < 0 ? cut - 0.5 : cut + 0.5);
    });
    return samples;
}

}  // namespace Cli
