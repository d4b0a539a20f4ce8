/**
 * @file
 * What a process holds, session by session.
 */
#pragma once

#include <cstddef>
#include <vector>

namespace Soak {

/** Bytes that the program has allocated and not freed; a sanitizer's quarantine does not count. */
std::size_t countLiveBytes();

/**
 * Whether `countLiveBytes` tells the truth. The C library counts what its threads keep for later as
 * allocated, unless it is told on the start of the program to keep nothing.
 */
bool isExact();

/** Whether a sanitizer's own memory is resident as well. */
bool isSanitized();

/** Resident memory as the system counts it. */
std::size_t countResidentBytes();

/** Measurements after equal numbers of sessions. */
class MemoryCurve {
  public:
    explicit MemoryCurve(int sessionsPerPoint) : sessions(sessionsPerPoint) {}

    void add(std::size_t bytes) { points.push_back(static_cast<double>(bytes)); }

    /** By how many bytes each session makes the curve rise, from point `first` on. */
    double getBytesPerSession(std::size_t first) const;

    /** The same measurements if each session had left this many bytes more. */
    MemoryCurve withLeak(double bytesPerSession) const;

  private:
    int sessions;
    std::vector<double> points;
};

}  // namespace Soak
