#pragma once

#include "LogOutput.h"
#include "RecognizeCommand.h"

namespace Cli {

/**
 * The whole tool but for the process around it: reads the arguments and runs the command that they
 * name. All errors are reported as one line on the console's error stream.
 * @return the exit status
 */
int runTool(int argc, const char* const* argv, Console& console, LogOutput& log);

}  // namespace Cli
