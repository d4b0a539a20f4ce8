/**
 * @file
 * The leveled log of what is not part of the engine.
 */
#pragma once

#include "core/Export.h"

/**
 * Writes to the platform log what is not above the level that the embedder has set. Any thread;
 * waits for the log sink only.
 */
class KORVEL_CORE_API Logger {
  public:
    /** What a message is about; the numbers are fixed. Higher numbers are more talkative. */
    enum Level {
        SILENT = 0,   /**< as the set level: nothing is written */
        PROBLEM = 1,  /**< something was refused or failed: bad use, failed requests */
        PROGRESS = 2, /**< what is going on, step by step, request addresses included */
    };

    /** The level until it is set. */
    static constexpr int LEVEL_DFLT = PROBLEM;

    /** Writes a printf-style message of any length when `level` is not above the set level. */
    static void log(int level, const char* format, ...) __attribute__((format(printf, 2, 3)));

    /** Sets the level for the whole process, until it is set again. */
    static void setLevel(int level);
    static int getLevel();
};
