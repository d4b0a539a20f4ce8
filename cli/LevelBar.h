#pragma once

#include <string>

namespace Cli {

/** Sound level in decibels at which a bar is full. */
const float LEVEL_BAR_MAX_DB = 45.0f;

/**
 * A bar of `width` characters for a sound level, such as "#####-----". Levels outside 0 to
 * `LEVEL_BAR_MAX_DB` give an empty or a full bar, a level that is no number an empty one.
 */
std::string levelBar(float levelDb, int width);

}  // namespace Cli
