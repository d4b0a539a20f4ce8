#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace TestSupport {

/**
 * Writes interleaved 16-bit samples as a sound file of any kind that libsndfile writes.
 * @param format such as `SF_FORMAT_WAV | SF_FORMAT_PCM_16`
 * @return whether everything was written
 */
bool writeSoundFile(const std::string& path, int format, int sampleRateHz, int channels,
                    const std::vector<int16_t>& samples);

/** A sine of the given frequency and amplitude. */
std::vector<int16_t> sine(int sampleRateHz, double seconds, double frequencyHz = 440,
                          double amplitude = 8000);

/**
 * Sound that the detector takes for speech: a harmonic tone with the pitch and the syllables of a
 * voice, over a faint noise.
 */
std::vector<int16_t> voiceLike(int sampleRateHz, double seconds);

/** The samples as raw 16-bit little-endian bytes. */
std::string rawBytes(const std::vector<int16_t>& samples);

}  // namespace TestSupport
