/**
 * @file
 * Programs of the system that tests run.
 */
#pragma once

#include <sys/types.h>

#include <string>
#include <vector>

#include "support/Spawn.h"

namespace TestSupport {

/** A running program; killed when its object goes. */
class ChildProcess {
  public:
    using Environment = TestSupport::Environment;

    struct Result {
        int exitStatus = -1; /**< -1 when it did not start or was ended by a signal */
        std::string output;  /**< what it wrote to its standard output and error */
    };

    /** True when the search path has such a program. */
    static bool isInstalled(const std::string& program);

    /** Runs a program to its end. */
    static Result run(const std::vector<std::string>& arguments,
                      const Environment& environment = {});

    /**
     * Starts a program found on the search path.
     * @param environment variables to set beside those of the test
     */
    explicit ChildProcess(const std::vector<std::string>& arguments,
                          const Environment& environment = {});
    ~ChildProcess();
    ChildProcess(const ChildProcess&) = delete;
    ChildProcess& operator=(const ChildProcess&) = delete;

    /** Reads a piece of its output; blocks until there is some. @return empty at the end */
    std::string read();

    void sendSignal(int number);

    /** Waits for the end. @return the exit status, or -1 when a signal ended it */
    int wait();

  private:
    pid_t pid = -1;
    int output = -1;
};

}  // namespace TestSupport
