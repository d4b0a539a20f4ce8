/**
 * @file
 * The engine's leveled log.
 */
#pragma once

#include "talvox/Export.h"

/**
 * Whether a message of this level is written at this moment, for callers whose arguments cost
 * something. As `tvLogFormatMessage` otherwise.
 */
bool tvIsLogged(int level);

/**
 * Writes a printf-style message to the platform log when `level` is not above the engine settings'
 * "verbosity" at this moment. Makes the engine facade if there is none yet. Any thread; waits for
 * the log sink only.
 */
TALVOX_API void tvLogFormatMessage(int level, const char* format, ...)
    __attribute__((format(printf, 2, 3)));
