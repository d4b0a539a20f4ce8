#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "core/sound/SoundDataBuffer.h"

namespace Cli {

/** Length of the buffers that a session asks of its recorder. */
const int BUFFER_MS = 100;

/** Samples of such a buffer. */
std::size_t bufferLength(int sampleRateHz);

/** The buffer that begins at sample `position`; behind the end of the sound it is silent. */
Sound::SoundDataBuffer bufferAt(const std::vector<int16_t>& samples, std::size_t position,
                                std::size_t length, int sampleRateHz);

/** Appends the samples of a 16-bit mono buffer. */
void appendSamples(std::vector<int16_t>& samples, const Sound::SoundDataBuffer& buffer);

}  // namespace Cli
