#pragma once

#include <atomic>
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

    /** Any thread. */
    void show(bool value) { shown = value; }

  private:
    static void receive(const char* message, void* self);

    std::ostream& out;
    std::mutex mutex;
    std::atomic<bool> shown{false};
};

}  // namespace Cli
