#pragma once

#include <string>

#include "LogOutput.h"
#include "RecognizeCommand.h"
#include "SettingsOptions.h"

namespace Cli {

/** What `talvox vad` was asked for. */
struct VadOptions {
    SettingsOptions settings;
    std::string file;        /**< path or `STANDARD_INPUT`; not used with `microphone` */
    bool microphone = false; /**< record from the default input device */
    int leadInMs = LEAD_IN_MS_DFLT;
    bool asSession = false; /**< end where a session ends, and print what it reports */
    bool json = false;
    std::string report; /**< HTML file; empty for none */
};

/**
 * `talvox vad`: runs the detector over the sound by the rules of a session, and prints what it
 * decides for every buffer, then the segments of speech.
 * @return the exit status
 * @throws UsageError
 */
int runVad(const VadOptions& options, Console& console, LogOutput& log);

}  // namespace Cli
