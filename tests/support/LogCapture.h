/**
 * @file
 * Catches the platform log for the length of a scope.
 */
#pragma once

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <mutex>
#include <string>
#include <vector>

#include "pal/kd_log.h"

namespace TestSupport {

/** Takes every log message, from any thread, while it lives. One at a time. */
class LogCapture {
  public:
    LogCapture() { kdSetLogSinkKOR(&LogCapture::receive, this); }
    ~LogCapture() { kdSetLogSinkKOR(nullptr, nullptr); }
    LogCapture(const LogCapture&) = delete;
    LogCapture& operator=(const LogCapture&) = delete;

    /** All messages so far, oldest first. */
    std::vector<std::string> messages() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return entries;
    }

    /** How often exactly this message was logged. */
    std::size_t count(const std::string& message) const {
        const std::lock_guard<std::mutex> lock(mutex);
        return static_cast<std::size_t>(std::count(entries.begin(), entries.end(), message));
    }

    bool contains(const std::string& message) const { return count(message) > 0; }

    /** True when a message has `part` somewhere in it. */
    bool containsPart(const std::string& part) const {
        const std::lock_guard<std::mutex> lock(mutex);
        return std::any_of(entries.begin(), entries.end(), [&part](const std::string& entry) {
            return entry.find(part) != std::string::npos;
        });
    }

    /** Waits until exactly this message was logged `times` times; false when it takes too long. */
    bool waitFor(const std::string& message, std::size_t times = 1) const {
        return waitUntil(times, [&](const std::string& entry) { return entry == message; });
    }

    /** Waits until `times` messages have `part` somewhere in them; false when it takes too long. */
    bool waitForPart(const std::string& part, std::size_t times = 1) const {
        return waitUntil(
            times, [&](const std::string& entry) { return entry.find(part) != std::string::npos; });
    }

    void clear() {
        const std::lock_guard<std::mutex> lock(mutex);
        entries.clear();
    }

  private:
    template <typename Match>
    bool waitUntil(std::size_t times, Match match) const {
        std::unique_lock<std::mutex> lock(mutex);
        return changed.wait_for(lock, std::chrono::seconds(10), [&] {
            return static_cast<std::size_t>(std::count_if(entries.begin(), entries.end(), match)) >=
                   times;
        });
    }

    static void receive(const char* message, void* user) {
        auto* self = static_cast<LogCapture*>(user);
        const std::lock_guard<std::mutex> lock(self->mutex);
        self->entries.emplace_back(message);
        self->changed.notify_all();
    }

    mutable std::mutex mutex;
    mutable std::condition_variable changed;
    std::vector<std::string> entries;
};

}  // namespace TestSupport
