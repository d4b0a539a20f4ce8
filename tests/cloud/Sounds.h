/**
 * @file
 * Buffers as a recorder makes them.
 */
#pragma once

#include <boost/make_shared.hpp>
#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "core/sound/SoundDataBuffer.h"
#include "support/TestSound.h"

namespace CloudTest {

const int SAMPLE_RATE = 16000;
const std::size_t SAMPLES_PER_BUFFER = 1600;

using Bytes = std::vector<unsigned char>;
using BufferPtr = boost::shared_ptr<const Sound::SoundDataBuffer>;

inline BufferPtr makeBuffer(Bytes bytes, int sampleRate = SAMPLE_RATE) {
    const Sound::SoundDataInfo info(Sound::SoundDataInfo::NONE, 1, sampleRate, 2,
                                    static_cast<int>(bytes.size() / 2));
    return boost::make_shared<Sound::SoundDataBuffer>(info, std::move(bytes));
}

/** A buffer of 100 ms whose samples all have this value. */
inline BufferPtr makeConstantBuffer(int16_t value) {
    return makeBuffer(TestSupport::toBytes(TestSupport::Samples(SAMPLES_PER_BUFFER, value), 0,
                                           SAMPLES_PER_BUFFER));
}

/** The bytes of such a buffer. */
inline std::string getConstantBytes(int16_t value) {
    const BufferPtr buffer = makeConstantBuffer(value);
    return {buffer->getData().begin(), buffer->getData().end()};
}

}  // namespace CloudTest
