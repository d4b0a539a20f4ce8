/**
 * @file
 * Proof that the mirrored instance is that of the linked core.
 */
#pragma once

#include "libs/src/vad_core.h"

/** What the proof drives: the core, or in tests something that differs from it. */
struct VadCoreFunctions {
    int (*init)(VadCore* core);
    int (*setMode)(VadCore* core, int mode);
};

/**
 * Initialises a core and sets each of the four modes, and looks whether their known tables then
 * stand where `VadCore` says and nothing was written behind it.
 * @return null when all is as mirrored, else what is wrong, in plain words (static text)
 */
const char* findVadLayoutFault(const VadCoreFunctions& functions);
