#pragma once

#include <istream>
#include <ostream>
#include <string>

#include "LogOutput.h"
#include "SettingsOptions.h"

namespace Cli {

/**
 * Silence that is played before a file. A file that begins in the middle of speech needs some, so
 * that the detector does not learn speech as the background.
 */
const int LEAD_IN_MS_DFLT = 0;
const int LEAD_IN_MS_MAX = 4000;

/** What `talvox recognize` was asked for. */
struct RecognizeOptions {
    SettingsOptions settings;
    std::string file;        /**< path or `STANDARD_INPUT`; not used with `microphone` */
    bool microphone = false; /**< record from the default input device */
    int leadInMs = LEAD_IN_MS_DFLT;
    std::string certificateFile; /**< authorities to trust beside the system's */
    std::string dumpDirectory;   /**< where the session's WAV dump goes; empty for none */
    std::string recordDirectory; /**< where the session is recorded; empty for nowhere */
    bool noSound = false;        /**< leave the sound out of the recording */
    std::string eventsFile;      /**< where the events go as JSON as well; empty for none */
    bool json = false;
};

/** A random identifier of an installation. */
std::string makeUuid();

/** The tool's defaults, over the engine's: a gateway on this machine, a fresh uuid, English. */
std::vector<SettingsOptions::Assignment> recognizeDefaults();

/** Standard streams, and which of them are terminals. */
struct Console {
    std::istream& in;
    std::ostream& out;
    std::ostream& err;
    bool outIsTerminal;
    bool errIsTerminal = false;
};

/**
 * `talvox recognize`: one recognition; Ctrl-C cancels it.
 * @return the exit status
 * @throws UsageError
 */
int runRecognize(const RecognizeOptions& options, Console& console, LogOutput& log);

}  // namespace Cli
