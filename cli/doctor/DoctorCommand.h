#pragma once

#include <string>
#include <vector>

#include "Check.h"
#include "cli/RecognizeCommand.h"

namespace CLI {
class App;
}

namespace Cli {

/** What `talvox doctor` was asked for. */
struct DoctorOptions {
    std::string url;
    std::string certificateFile; /**< authorities to trust beside the system's */
    std::string uuid;            /**< empty for a random one */
    std::string language = "en-US";
    int timeoutS = 20; /**< longest wait for an answer: as long as a session waits */
    int idleS = 6;     /**< how long a kept connection is watched; 0 for not at all */
    bool json = false;
};

/** Reads the arguments of `talvox doctor` and runs it. */
class DoctorCommand {
  public:
    /** Adds the command to the tool's arguments; the object outlives their reading. */
    explicit DoctorCommand(CLI::App& tool);
    DoctorCommand(const DoctorCommand&) = delete;
    DoctorCommand& operator=(const DoctorCommand&) = delete;

    bool isParsed() const;

    /** @return the exit status @throws UsageError */
    int run(Console& console) const;

  private:
    CLI::App* command_ = nullptr;
    DoctorOptions options_;
};

}  // namespace Cli
