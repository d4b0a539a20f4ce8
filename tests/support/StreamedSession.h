/**
 * @file
 * What a buffer of sound allocates on its way from a device's thread to the server.
 */
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace TestSupport {

/** Heap allocations for each buffer of 100 ms, on average. */
struct BufferAllocations {
    double all = 0;
    double onAudioThread = 0;
    double underEventLock = 0;
};

/**
 * The most that is wanted. What is left in steady state is room for what has been sent, which is
 * kept for a second attempt.
 */
constexpr BufferAllocations BUFFER_ALLOCATIONS_MAX = {1, 0, 1};

/**
 * Runs a chunked session whose recorder has a device thread of its own and whose server is on
 * loopback, by the hand-driven clock, and counts over 12.8 s of it, beginning after
 * 3.2 s. The
 * program links AllocationCount.cpp. The engine's settings and the recorder's factory are replaced.
 *
 * @param speech      16 kHz mono, at least 16 s
 * @param soundFormat a value of the setting "soundformat"
 * @throws std::runtime_error when the server does not get the sound
 */
BufferAllocations measureBufferAllocations(const std::vector<int16_t>& speech,
                                           const std::string& soundFormat);

}  // namespace TestSupport
