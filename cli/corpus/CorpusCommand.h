#pragma once

#include <string>

#include "CorpusMaker.h"
#include "cli/RecognizeCommand.h"

namespace CLI {
class App;
}

namespace Cli {

/** What `talvox corpus` was asked for. */
struct CorpusOptions {
    std::string folder;
    CorpusPlan plan;
    bool replacesLabels = false;
};

/** Reads the arguments of `talvox corpus` and runs it. */
class CorpusCommand {
  public:
    /** Adds the command to the tool's arguments; the object outlives their reading. */
    explicit CorpusCommand(CLI::App& tool);
    CorpusCommand(const CorpusCommand&) = delete;
    CorpusCommand& operator=(const CorpusCommand&) = delete;

    bool isParsed() const;

    /** @return the exit status @throws UsageError */
    int run(Console& console, LogOutput& log) const;

  private:
    CLI::App* make_ = nullptr;
    CLI::App* label_ = nullptr;
    CorpusOptions options_;
};

/** `talvox corpus make`. @throws UsageError */
int runCorpusMake(const CorpusOptions& options, Console& console);

/** `talvox corpus label`: status 2 if a sound could not be read. @throws UsageError */
int runCorpusLabel(const CorpusOptions& options, Console& console);

}  // namespace Cli
