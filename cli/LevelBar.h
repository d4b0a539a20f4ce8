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

/** A level right-aligned, such as "  22.5 dB"; digital silence is "  silence", whatever the level.
 */
std::string levelText(float levelDb, bool isSilence);

/** What the levels of a session are relative to; in general mode that is its leading noise. */
std::string levelReference(bool isGeneralMode);

}  // namespace Cli
