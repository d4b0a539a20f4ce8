/**
 * @file
 * Speech that the gateway's tests recognise, and ways to encode it.
 */
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace GatewayTest {

/** Samples of a file of 16-bit mono sound, raw or WAV. Throws when it cannot be read. */
std::vector<int16_t> readSound(const std::string& path);

/** Samples of a recording of the pocketsphinx-testdata package, 16 kHz mono. Throws without it. */
std::vector<int16_t> readRecording(const std::string& name);

/** Samples as 16-bit little-endian bytes. */
std::string toPcm(const std::vector<int16_t>& samples);

/** Every second sample of sound that was smoothed before: the sound at half its rate. */
std::vector<int16_t> halveRate(const std::vector<int16_t>& samples);

/** Ogg Speex, made by the `speexenc` program. Throws when that fails. */
std::string encodeWithSpeexenc(const std::vector<int16_t>& samples, int rateHz,
                               const std::string& mode);

}  // namespace GatewayTest
