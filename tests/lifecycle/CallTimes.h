/**
 * @file
 * How long calls of the application take.
 */
#pragma once

#include <chrono>
#include <cstddef>
#include <vector>

namespace Lifecycle {

/** The durations of calls of one kind, in microseconds. */
class CallTimes {
    using Clock = std::chrono::steady_clock;

  public:
    /** Measures its own lifetime. */
    class Stopwatch {
      public:
        explicit Stopwatch(CallTimes& kind) : times(kind) {}
        ~Stopwatch() {
            const std::chrono::duration<float, std::micro> taken = Clock::now() - start;
            times.durations.push_back(taken.count());
        }
        Stopwatch(const Stopwatch&) = delete;
        Stopwatch& operator=(const Stopwatch&) = delete;

      private:
        CallTimes& times;
        const Clock::time_point start = Clock::now();
    };

    std::size_t count() const { return durations.size(); }
    /** So many of a thousand calls took no longer than this. */
    float quantile(int ofThousand) const;

  private:
    std::vector<float> durations;
};

}  // namespace Lifecycle
