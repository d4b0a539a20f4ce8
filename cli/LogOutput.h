#pragma once

#include <mutex>
#include <ostream>

namespace Cli {

/**
 * Owns the platform log while it lives: messages are dropped until `show(true)`, then written to
 * the stream, one line each, marked as the tool's.
 */
class LogOutput {
  public:
    explicit LogOutput(std::ostream& output);
    ~LogOutput();
    LogOutput(const LogOutput&) = delete;
    LogOutput& operator=(const LogOutput&) = delete;

    /** Any thread. After `show(false)` has returned no message is written any more. */
    void show(bool value);

  private:
    static void receive(const char* message, void* self);

    std::ostream& out;
    std::mutex mutex;
    bool shown = false;
};

}  // namespace Cli
