/**
 * @file
 * Counts the heap allocations of the whole process, those of the C libraries included. A program
 * that links AllocationCount.cpp counts from its start; sanitizers report each allocation to a
 * hook, and without them the program's own malloc, calloc and realloc stand in front of glibc's.
 */
#pragma once

#include <cstdint>

namespace TestSupport {

struct AllocationCounts {
    uint64_t all = 0;
    uint64_t onAudioThread = 0;  /**< on threads that called `markAudioThread` */
    uint64_t underEventLock = 0; /**< on threads that held the event lock */
};

/** Allocations since the process began; by thread and lock since the first call. Any thread. */
AllocationCounts countAllocations();

/** Counts what the calling thread allocates as the audio thread's, too, from now on. */
void markAudioThread();

}  // namespace TestSupport
