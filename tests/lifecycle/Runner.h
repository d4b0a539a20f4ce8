/**
 * @file
 * Runs sequences by their seeds and reports what it finds.
 */
#pragma once

#include <cstdint>
#include <string>

namespace Lifecycle {

class Testbed;

/** Seeds one after the other. */
struct Range {
    std::uint64_t first;
    std::uint64_t count;
};

/**
 * Runs the sequences of these seeds up to the first that goes wrong.
 * @return empty, or all that helps to find the fault: the seed, the sequence without what does not
 *         matter, and what happens in it
 */
std::string run(Testbed& testbed, const Range& range);

}  // namespace Lifecycle
