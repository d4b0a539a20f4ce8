#pragma once

#include <cstddef>
#include <istream>
#include <string>

#include "AudioClip.h"

namespace Cli {

/**
 * Reads raw sound, 16-bit signed little-endian mono, until the stream ends or `maxSamples` have
 * been read. A last odd byte is dropped.
 * @param head bytes that were taken from the stream before, at most `maxSamples` x 2
 * @throws UsageError if the stream holds no sample
 */
AudioClip readRawAudio(std::istream& in, int sampleRateHz, std::size_t maxSamples,
                       const std::string& head = "");

/**
 * Reads the first `maxSeconds` of a stream: a WAV file if it begins like one, else raw sound as
 * `readRawAudio` does. A WAV file that ends too early is treated as by `readAudioFile`.
 * @param rawRateHz the sample rate of raw sound; a WAV file has its own
 * @throws UsageError if there is no sound in the stream or it is a sound file of another kind
 */
AudioClip readAudioStream(std::istream& in, int rawRateHz, int maxSeconds);

}  // namespace Cli
