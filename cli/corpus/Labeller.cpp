#include "Labeller.h"

#include <algorithm>
#include <cmath>

namespace Cli {

namespace {

const int FRAME_MS = 10;
const int GAP_MAX_MS = 200;
const int STRETCH_MIN_MS = 80;
const double ABOVE_NOISE_DB = 8;
const double BELOW_PEAK_DB = 40;

std::vector<double> frameLevels(const CorpusSound& sound) {
    const auto length = static_cast<std::size_t>(sound.rateHz / (1000 / FRAME_MS));
    std::vector<double> levels;
    for (std::size_t begin = 0; begin + length <= sound.samples.size(); begin += length) {
        double energy = 0;
        for (std::size_t index = begin; index < begin + length; ++index) {
            energy += static_cast<double>(sound.samples[index]) * sound.samples[index];
        }
        // The one stands for the silence that no microphone has.
        levels.push_back(10 * std::log10(energy / static_cast<double>(length) + 1));
    }
    return levels;
}

double levelAt(std::vector<double> levels, double share) {
    const auto place = static_cast<std::ptrdiff_t>(static_cast<double>(levels.size() - 1) * share);
    std::nth_element(levels.begin(), levels.begin() + place, levels.end());
    return levels[static_cast<std::size_t>(place)];
}

void addFrame(std::vector<Label>& stretches, int64_t startMs) {
    if (!stretches.empty() && startMs - stretches.back().endMs <= GAP_MAX_MS) {
        stretches.back().endMs = startMs + FRAME_MS;
    } else {
        stretches.push_back({startMs, startMs + FRAME_MS, "speech"});
    }
}

}  // namespace

std::vector<Label> proposeLabels(const CorpusSound& sound) {
    const std::vector<double> levels = frameLevels(sound);
    std::vector<Label> stretches;
    if (levels.empty()) {
        return stretches;
    }
    const double threshold =
        std::max(levelAt(levels, 0.1) + ABOVE_NOISE_DB, levelAt(levels, 0.99) - BELOW_PEAK_DB);
    for (std::size_t frame = 0; frame < levels.size(); ++frame) {
        if (levels[frame] > threshold) {
            addFrame(stretches, static_cast<int64_t>(frame) * FRAME_MS);
        }
    }
    stretches.erase(std::remove_if(stretches.begin(), stretches.end(),
                                   [](const Label& label) {
                                       return label.endMs - label.startMs < STRETCH_MIN_MS;
                                   }),
                    stretches.end());
    return stretches;
}

}  // namespace Cli
