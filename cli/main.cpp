#include <unistd.h>

#include <csignal>
#include <iostream>

#include "CommandLine.h"
#include "ExitStatus.h"
#include "tools/AssertionHandler.h"

int main(int argc, char** argv) {
    // Writing to a reader that has gone shows as a failed stream instead of ending the process.
    std::signal(SIGPIPE, SIG_IGN);
    // Before the engine's own singletons, so that it outlives them.
    static Cli::LogOutput log(std::cerr);
    Tools::installAssertionHandler("talvox");
    Cli::Console console{std::cin, std::cout, std::cerr, isatty(STDOUT_FILENO) == 1};
    const int status = Cli::runTool(argc, argv, console, log);
    if (!std::cout.flush()) {
        std::cerr << "talvox: cannot write to standard output" << std::endl;
        return status == Cli::EXIT_OK ? Cli::EXIT_ENDED_IN_ERROR : status;
    }
    return status;
}
