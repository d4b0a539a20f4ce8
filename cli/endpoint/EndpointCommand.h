#pragma once

#include <optional>
#include <string>
#include <vector>

#include "Sweep.h"
#include "cli/RecognizeCommand.h"

namespace CLI {
class App;
}

namespace Cli {

/** What `talvox endpoint` was asked for. */
struct EndpointOptions {
    std::string folder;
    std::vector<std::string> vads; /**< as given; may name presets */
    std::string mode;              /**< of the session, as in its setting */
    std::vector<std::string> groups;
    int pauseMaxMs = 20000; /**< sounds with a longer pause inside the speech are left out */
    unsigned jobs = 0;      /**< threads; 0 for as many as there are processors */
    bool json = false;
    bool csv = false;
    std::string report; /**< HTML file; empty for none */

    // Of a sweep only.
    std::string grid;
    std::string lost;
    std::string falseBegin;
    std::optional<double> latencyMs;
    bool startsOver = false;
};

/** Reads the arguments of `talvox endpoint` and runs it. */
class EndpointCommand {
  public:
    /** Adds the command to the tool's arguments; the object outlives their reading. */
    explicit EndpointCommand(CLI::App& tool);
    EndpointCommand(const EndpointCommand&) = delete;
    EndpointCommand& operator=(const EndpointCommand&) = delete;

    bool isParsed() const;

    /** @return the exit status @throws UsageError */
    int run(Console& console, LogOutput& log) const;

  private:
    CLI::App* score_ = nullptr;
    CLI::App* sweep_ = nullptr;
    EndpointOptions options_;
};

/** Detectors with these parameter texts, in the session mode of the options. */
std::vector<DetectorSetup> makeSetups(const EndpointOptions& options,
                                      const std::vector<std::string>& vads);

/** Warns of each mistake in the texts once. */
void warnOfVadMistakes(const std::vector<DetectorSetup>& setups, std::ostream& err);

/** `talvox endpoint score`: status 2 if a sound could not be scored. @throws UsageError */
int runScore(const EndpointOptions& options, Console& console);

/** `talvox endpoint sweep`: status 2 if a sound could not be scored. @throws UsageError */
int runSweep(const EndpointOptions& options, Console& console);

}  // namespace Cli
