#pragma once

#include <sys/types.h>

#include <string>
#include <vector>

namespace TestSupport {

/** What a finished process left behind. */
struct ToolResult {
    int status = -1; /**< exit status; 128 + signal number when a signal ended it */
    std::string out;
    std::string err;
};

/**
 * A tool of this project that runs as a process of its own, with pipes for its standard streams.
 * Waits end, and the process is killed, after half a minute.
 */
class ToolProcess {
  public:
    /** @param arguments without the program's own name */
    ToolProcess(const std::string& program, const std::vector<std::string>& arguments,
                const std::string& input = "");
    ~ToolProcess();
    ToolProcess(const ToolProcess&) = delete;
    ToolProcess& operator=(const ToolProcess&) = delete;

    /**
     * Reads the standard output up to the first line that has `part` in it.
     * @return that line, or an empty text when the output ended before
     */
    std::string waitForLine(const std::string& part);

    void signal(int number) const;

    /** Reads to the end and waits for the process. */
    ToolResult wait();

  private:
    bool readMore();

    pid_t pid = -1;
    int inputEnd = -1;
    int outEnd = -1;
    int errEnd = -1;
    std::string input;
    ToolResult result;
};

/** Runs the command-line tool to its end. */
ToolResult runTalvox(const std::vector<std::string>& arguments, const std::string& input = "");

}  // namespace TestSupport
