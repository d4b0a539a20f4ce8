#include "EventQueue.h"

#include <utility>

namespace Cli {

void EventQueue::put(SessionEvent event) {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        events.push_back(std::move(event));
    }
    changed.notify_one();
}

void EventQueue::interrupt() {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        interrupted = true;
    }
    changed.notify_one();
}

std::optional<SessionEvent> EventQueue::take() {
    std::unique_lock<std::mutex> lock(mutex);
    changed.wait(lock, [this] { return interrupted || !events.empty(); });
    if (interrupted) {
        interrupted = false;
        return std::nullopt;
    }
    SessionEvent event = std::move(events.front());
    events.pop_front();
    return event;
}

}  // namespace Cli
