#pragma once

#include <functional>
#include <thread>

namespace Cli {

/**
 * Turns Ctrl-C into a call: while an object of this class lives, the first SIGINT or SIGTERM calls
 * `onInterrupt` on a thread of its own, and the second ends the process at once with status 130,
 * whatever its threads wait for. One object at a time.
 */
class Interrupts {
  public:
    explicit Interrupts(std::function<void()> onInterrupt);
    ~Interrupts();
    Interrupts(const Interrupts&) = delete;
    Interrupts& operator=(const Interrupts&) = delete;

  private:
    void watch() const;

    std::function<void()> callback;
    std::thread watcher;
};

}  // namespace Cli
