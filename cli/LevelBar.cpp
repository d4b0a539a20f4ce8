#include "LevelBar.h"

#include <algorithm>
#include <cmath>

#include "Text.h"

namespace Cli {

std::string levelBar(float levelDb, int width) {
    const float share =
        std::isnan(levelDb) ? 0.0f : std::min(1.0f, std::max(0.0f, levelDb / LEVEL_BAR_MAX_DB));
    const auto full = static_cast<int>(std::lround(share * static_cast<float>(width)));
    return std::string(static_cast<std::size_t>(full), '#') +
           std::string(static_cast<std::size_t>(width - full), '-');
}

std::string levelText(float levelDb, bool isSilence) {
    return isSilence ? "  silence" : fixed(static_cast<double>(levelDb), 6, 1) + " dB";
}

std::string levelReference(bool isGeneralMode) {
    return isGeneralMode ? "dB above the leading noise"
                         : "dB above -60.3 dBFS (full scale is 60.3 dB)";
}

}  // namespace Cli
