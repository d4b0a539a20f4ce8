#pragma once

#include <mutex>
#include <ostream>
#include <string>

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

    /**
     * From now on looks for `text` in each message, shown or not: some failures are known to the
     * log only. Any thread.
     */
    void watchFor(const std::string& text);

    /** Whether the text of the latest `watchFor` has come. Any thread. */
    bool hasSeenWatched();

  private:
    static void receive(const char* message, void* self);

    std::ostream& out;
    std::mutex mutex;
    bool shown = false;
    std::string watched;
    bool seenWatched = false;
};

}  // namespace Cli
