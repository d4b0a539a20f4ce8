/**
 * @file
 * Ready-made values of the "vad" setting for kinds of use.
 */
#pragma once

#include <array>

#include "talvox/Export.h"

namespace Talvox {

/**
 * A parameter text for the "vad" setting, measured for a kind of use. docs/ENDPOINTING.md has the
 * figures of each and the command that measures them. The setting itself stays a text:
 *
 *     settings->putString(Settings::SKS_VAD_SETTINGS, EndOfSpeech::DICTATION);
 *
 * Any thread; never blocks.
 */
struct TALVOX_API EndOfSpeech {
    /** For short commands without pauses: a quick end. */
    static const char* const COMMAND;
    /** For sentences with pauses between their parts: a late end. */
    static const char* const DICTATION;
    /** For places with clicks, hum or wind: noise seldom begins speech. */
    static const char* const NOISY;

    const char* name;       /**< as `talvox --vad preset:NAME` takes it */
    const char* parameters; /**< the value for the "vad" setting */
    const char* meaning;    /**< what it is for, in a few words */

    /** All presets. */
    static const std::array<EndOfSpeech, 3>& all();
};

}  // namespace Talvox
