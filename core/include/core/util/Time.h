/**
 * @file
 * Units of the clock, which counts nanoseconds.
 */
#pragma once

#include <cstdint>

namespace Util {

/** Nanoseconds in a millisecond. */
constexpr int64_t NS_PER_MS = 1000000;

/** Nanoseconds in a second. */
constexpr int64_t NS_PER_S = 1000000000;

}  // namespace Util
