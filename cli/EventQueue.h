#pragma once

#include <condition_variable>
#include <deque>
#include <mutex>
#include <optional>

#include "EventPrinter.h"

namespace Cli {

/**
 * Takes events from the engine's thread, which must not wait for a slow terminal or pipe, to the
 * thread that prints them. Any thread may put; one takes.
 */
class EventQueue {
  public:
    void put(SessionEvent event);

    /** Makes one `take` return without an event, ahead of the events that wait. */
    void interrupt();

    /** The next event, waiting for it; nothing when `interrupt` was called. */
    std::optional<SessionEvent> take();

  private:
    std::mutex mutex;
    std::condition_variable changed;
    std::deque<SessionEvent> events;
    bool interrupted = false;
};

}  // namespace Cli
