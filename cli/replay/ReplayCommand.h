#pragma once

#include <string>

#include "cli/RecognizeCommand.h"

namespace CLI {
class App;
}

namespace Cli {

/** Reads the arguments of `talvox replay` and runs it. */
class ReplayCommand {
  public:
    /** Adds the command to the tool's arguments; the object outlives their reading. */
    explicit ReplayCommand(CLI::App& tool);
    ReplayCommand(const ReplayCommand&) = delete;
    ReplayCommand& operator=(const ReplayCommand&) = delete;

    bool isParsed() const;

    /** @return the exit status @throws UsageError */
    int run(Console& console, LogOutput& log) const;

  private:
    CLI::App* command_ = nullptr;
    std::string folder_;
    bool verbose_ = false;
};

}  // namespace Cli
