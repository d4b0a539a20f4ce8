#pragma once

#include <string>

namespace Cli {

/**
 * The file "in.wav" of a directory, in which a session leaves what it heard. The engine writes it
 * and reports no failure; so the tool looks at the file before and after.
 */
class Dump {
  public:
    /**
     * Leaves a file that is there as it is.
     * @throws UsageError if the file cannot be written
     */
    explicit Dump(const std::string& directory);

    /** Empties the file and makes the sessions from now on write it. */
    void begin() const;

    /** Whether the file holds all of the sound that its header promises; valid after a session. */
    bool isComplete() const;

    const std::string& getPath() const { return path; }

  private:
    std::string directoryPath;
    std::string path;
};

}  // namespace Cli
