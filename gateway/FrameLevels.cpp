#include "gateway/FrameLevels.h"

#include <algorithm>
#include <cmath>

namespace Gateway {

namespace {

/** Frames whose quietest is the peak: 200 ms. */
constexpr std::size_t PEAK_FRAMES = 20;
/** The share of frames that are background at least. */
constexpr std::size_t BACKGROUND_SHARE = 10;
/** The hiss of a microphone. Sound that begins with digital silence is not speech for that. */
constexpr double MIN_BACKGROUND_DB = 25;
/** Speech is that much louder than the background at its peak. */
constexpr double MIN_CONTRAST_DB = 15;
/** Stationary noise varies less than this. */
constexpr double BACKGROUND_RANGE_DB = 6;
/** Range of levels in speech. */
constexpr double SPEECH_RANGE_DB = 25;

double toDecibels(double meanSquare) {
    return 10 * std::log10(meanSquare + 1);
}

}  // namespace

void FrameLevels::add(const int16_t* samples, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) {
        const double sample = samples[i];
        stepEnergy += sample * sample;
        if (++stepSamples < STEP_SAMPLES) {
            continue;
        }
        if (lastStepEnergy >= 0) {
            levelsDb.push_back(toDecibels((lastStepEnergy + stepEnergy) / (2 * STEP_SAMPLES)));
        }
        lastStepEnergy = stepEnergy;
        stepEnergy = 0;
        stepSamples = 0;
    }
}

double FrameLevels::findSpeechLevel() const {
    std::vector<double> levels = levelsDb;
    if (levels.size() < PEAK_FRAMES) {
        return -1;
    }
    const auto background =
        levels.begin() + static_cast<std::ptrdiff_t>(levels.size() / BACKGROUND_SHARE);
    std::nth_element(levels.begin(), background, levels.end());
    const double backgroundDb = std::max(*background, MIN_BACKGROUND_DB);
    const auto peak = levels.end() - static_cast<std::ptrdiff_t>(PEAK_FRAMES);
    std::nth_element(levels.begin(), peak, levels.end());
    const double peakDb = *peak;
    if (peakDb < backgroundDb + MIN_CONTRAST_DB) {
        return -1;
    }
    return std::max(peakDb - SPEECH_RANGE_DB, backgroundDb + BACKGROUND_RANGE_DB);
}

}  // namespace Gateway
