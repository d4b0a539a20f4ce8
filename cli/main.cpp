#include <unistd.h>

#include <csignal>
#include <iostream>

#include "CommandLine.h"
#include "ExitStatus.h"
#include "pal/kd_assert.h"

namespace {

/** A broken invariant is told and survived: the settings of a trial must not end in a core dump. */
void reportAssertion(const char* condition, const char* file, KDint line, void* /*user*/) {
    std::cerr << "talvox: assertion failed: " << condition << " (" << file << ':' << line << ")"
              << std::endl;
}

}  // namespace

int main(int argc, char** argv) {
    // Writing to a reader that has gone shows as a failed stream instead of ending the process.
    std::signal(SIGPIPE, SIG_IGN);
    // Before the engine's own singletons, so that it outlives them.
    static Cli::LogOutput log(std::cerr);
    kdSetAssertionHandlerKOR(reportAssertion, nullptr);
    Cli::Console console{std::cin, std::cout, std::cerr, isatty(STDOUT_FILENO) == 1};
    const int status = Cli::runTool(argc, argv, console, log);
    if (!std::cout.flush()) {
        std::cerr << "talvox: cannot write to standard output" << std::endl;
        return status == Cli::EXIT_OK ? Cli::EXIT_ENDED_IN_ERROR : status;
    }
    return status;
}
