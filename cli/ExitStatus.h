#pragma once

namespace Cli {

/** What the process tells the shell. */
enum ExitStatus {
    EXIT_OK = 0,             /**< the command did what it was asked for; results were delivered */
    EXIT_ENDED_IN_ERROR = 1, /**< the recognition ended in an error, nothing was delivered, or an
                                output could not be written */
    EXIT_USAGE = 2           /**< wrong usage or unreadable input */
};

}  // namespace Cli
