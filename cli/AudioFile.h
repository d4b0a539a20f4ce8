#pragma once

#include <cstddef>
#include <istream>
#include <string>
#include <vector>

namespace Cli {

/** Mono sound; the samples have the scale of 16-bit numbers, -32768 to 32767. */
struct AudioClip {
    std::vector<float> samples;
    int sampleRateHz = 0;
};

/** Longest sound that is read, in seconds. */
const int MAX_CLIP_SECONDS = 3600;

/**
 * Reads a sound file of any format that libsndfile knows and mixes its channels down to one.
 * A file that was cut short gives the sound that is there.
 * @throws UsageError with the path and the reason when there is no sound to be had from the file
 */
AudioClip readAudioFile(const std::string& path);

/**
 * Reads raw sound, 16-bit signed little-endian mono, until the stream ends or `maxSamples` have
 * been read. A last odd byte is dropped.
 * @throws UsageError when the stream holds no sample
 */
AudioClip readRawAudio(std::istream& in, int sampleRateHz, std::size_t maxSamples);

}  // namespace Cli
