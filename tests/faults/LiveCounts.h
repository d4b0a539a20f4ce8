/**
 * @file
 * What is in use in this process.
 */
#pragma once

#include <cstddef>
#include <ostream>

namespace FaultTest {

/** Counts that are the same before and after something that leaks nothing. */
struct LiveCounts {
    std::size_t descriptors = 0;
    std::size_t threads = 0;
    std::size_t timers = 0; /**< set and not yet given back */
    std::size_t tasks = 0;  /**< background work that is queued or runs */

    static LiveCounts now();
    static std::size_t countTasks();

    bool operator==(const LiveCounts& other) const;
};

void PrintTo(const LiveCounts& counts, std::ostream* out);

/**
 * Waits until the counts are these again; a thread may be gone for its joiner before it is for the
 * system. @return the latest counts
 */
LiveCounts waitForCounts(const LiveCounts& expected);

}  // namespace FaultTest
