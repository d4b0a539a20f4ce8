#pragma once

#include <string>

namespace Cli {

class LogOutput;

/**
 * The file "in.wav" of a directory, in which a session leaves what it heard. The engine writes it
 * and reports a failure to the log only; so the tool looks at the file before and after, and
 * watches the log.
 */
class Dump {
  public:
    /**
     * Leaves a file that is there as it is.
     * @throws UsageError if the file cannot be written
     */
    explicit Dump(const std::string& directory);

    /** Empties the file and makes the sessions from now on write it. */
    void begin(LogOutput& log) const;

    /** Whether the file holds all that was heard; valid after a session. */
    bool isComplete(LogOutput& log) const;

    const std::string& getPath() const { return path; }

  private:
    std::string directoryPath;
    std::string path;
};

}  // namespace Cli
