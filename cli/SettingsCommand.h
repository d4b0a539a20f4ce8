#pragma once

#include <ostream>

#include "LogOutput.h"
#include "SettingsOptions.h"

namespace Cli {

/**
 * `talvox settings`: writes the settings that the options make, as validation leaves them, as XML;
 * what was wrong in the document and each repair goes to the log.
 * @return the exit status
 */
int runSettings(const SettingsOptions& options, std::ostream& out, LogOutput& log);

}  // namespace Cli
