#pragma once

#include <string>
#include <vector>

#include "cli/RecognizeCommand.h"

namespace CLI {
class App;
}

namespace Cli {

/** What `talvox report` was asked for. */
struct ReportOptions {
    std::vector<std::string> folders;
    std::string output; /**< HTML file; empty for none */
    bool json = false;
};

/** Reads the arguments of `talvox report` and runs it. */
class ReportCommand {
  public:
    /** Adds the command to the tool's arguments; the object outlives their reading. */
    explicit ReportCommand(CLI::App& tool);
    ReportCommand(const ReportCommand&) = delete;
    ReportCommand& operator=(const ReportCommand&) = delete;

    bool isParsed() const;

    /** @return the exit status @throws UsageError */
    int run(Console& console) const;

  private:
    CLI::App* command_ = nullptr;
    ReportOptions options_;
};

}  // namespace Cli
