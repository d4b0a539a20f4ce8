#include <poll.h>
#include <unistd.h>

#include <csignal>
#include <iostream>

#include "CommandLine.h"
#include "ExitStatus.h"
#include "tools/AssertionHandler.h"

namespace {

/** Whether the standard output is a pipe or socket that is no longer read, as after "| head -1". */
bool isReaderGone() {
    pollfd output = {STDOUT_FILENO, POLLOUT, 0};
    return poll(&output, 1, 0) > 0 && (output.revents & POLLERR) != 0;
}

}  // namespace

int main(int argc, char** argv) {
    // A reader that leaves early ends neither a session nor what else it writes.
    std::signal(SIGPIPE, SIG_IGN);
    // Before the engine's own singletons, so that it outlives them.
    static Cli::LogOutput log(std::cerr);
    Tools::installAssertionHandler("talvox");
    Cli::Console console{std::cin, std::cout, std::cerr, isatty(STDOUT_FILENO) == 1,
                         isatty(STDERR_FILENO) == 1};
    const int status = Cli::runTool(argc, argv, console, log);
    if (!std::cout.flush() && !isReaderGone()) {
        std::cerr << "talvox: cannot write to standard output" << std::endl;
        return status == Cli::EXIT_OK ? Cli::EXIT_ENDED_IN_ERROR : status;
    }
    return status;
}
