#pragma once

#include <string>
#include <vector>

#include "LogOutput.h"
#include "RecognizeCommand.h"
#include "logcollector/LogCollector.h"

namespace Cli {

const int LOG_TIMEOUT_S_DFLT = 30;
const int LOG_TIMEOUT_S_MAX = 24 * 60 * 60;
const int LOG_VERBOSITY_DFLT = 1;
const int LOG_VERBOSITY_MAX = 2;

/** What `talvox log` was asked for. */
struct LogOptions {
    std::string url = LogCollector::LogCollector::URL_DFLT;
    std::string certificateFile; /**< authorities to trust beside the system's */
    std::string uuid;
    std::string session;
    std::string name;
    std::vector<std::string> params; /**< key=value */
    bool error = false;
    std::string store; /**< folder for records that are not delivered; empty for none */
    int timeoutS = LOG_TIMEOUT_S_DFLT;
    int verbosity = LOG_VERBOSITY_DFLT;
};

/**
 * `talvox log`: sends one event with the collector, after what the store has, and waits until all
 * is delivered, the time is over, or Ctrl-C is pressed.
 * @return the exit status
 * @throws UsageError
 */
int runLog(const LogOptions& options, Console& console, LogOutput& log);

}  // namespace Cli
