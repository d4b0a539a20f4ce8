// Counts heap allocations of the whole process, those of C libraries included (glibc only).
#pragma once

#include <cstdint>

namespace Bench {

/** Allocations since the process began. Any thread. */
uint64_t allocationCount();

/** Resident memory of the process in KiB. */
long residentKiB();

/** Processor time that the whole process has used, in milliseconds. */
double processCpuMs();

}  // namespace Bench
