#include "LevelBar.h"

#include <algorithm>
#include <cmath>

namespace Cli {

std::string levelBar(float levelDb, int width) {
    const float share =
        std::isnan(levelDb) ? 0.0f : std::min(1.0f, std::max(0.0f, levelDb / LEVEL_BAR_MAX_DB));
    const auto full = static_cast<int>(std::lround(share * static_cast<float>(width)));
    return std::string(static_cast<std::size_t>(full), '#') +
           std::string(static_cast<std::size_t>(width - full), '-');
}

}  // namespace Cli
