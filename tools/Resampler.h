#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

// Named so by the library that the resampler comes from.
struct SpeexResamplerState_;

namespace Tools {

/**
 * Brings mono sound to another rate as it arrives. How the sound is cut into calls does not
 * change what comes out; its delay is taken off, so that the first sample stays the first. N
 * samples become N x output rate / input rate, rounded to the nearest. Between equal rates the
 * sound stays as it is, bit for bit.
 */
class Resampler {
  public:
    /** @throws std::invalid_argument when the rates cannot be converted into each other */
    Resampler(unsigned inputRateHz, unsigned outputRateHz);
    ~Resampler();
    Resampler(const Resampler&) = delete;
    Resampler& operator=(const Resampler&) = delete;

    /** Appends to `output` what the samples give so far. */
    void write(const int16_t* samples, std::size_t count, std::vector<int16_t>& output);

    /** Appends what is still inside; nothing may be written afterwards. */
    void finish(std::vector<int16_t>& output);

  private:
    /** Converts until the samples are used up or `limit` have come out since the beginning. */
    void run(const int16_t* samples, std::size_t count, uint64_t limit,
             std::vector<int16_t>& output);

    const unsigned inputRate;
    const unsigned outputRate;
    /** Null where nothing is to be done. */
    SpeexResamplerState_* state = nullptr;
    uint64_t consumed = 0;
    uint64_t produced = 0;
};

}  // namespace Tools
