#include "Sounds.h"

#include <boost/make_shared.hpp>
#include <string>
#include <vector>

namespace Lifecycle {

namespace {

const int SAMPLE_RATE_HZ = 16000;
const std::size_t LIGHT_BYTES = 16;

using Bytes = std::vector<unsigned char>;

boost::shared_ptr<const Sound::SoundDataBuffer> makeBuffer(Bytes bytes, int sampleCount,
                                                           int sampleRateHz = SAMPLE_RATE_HZ,
                                                           int channels = 1) {
    const Sound::SoundDataInfo format(Sound::SoundDataInfo::NONE, channels, sampleRateHz, 2,
                                      sampleCount);
    return boost::make_shared<Sound::SoundDataBuffer>(format, std::move(bytes));
}

/** Bytes that stand nowhere else. */
Bytes makeBytes(int session, std::size_t size) {
    static unsigned serial = 0;
    const std::string text =
        "sound " + std::to_string(++serial) + " of session " + std::to_string(session) + " ";
    Bytes bytes(size);
    for (std::size_t i = 0; i < size; ++i) {
        bytes[i] = static_cast<unsigned char>(text[i % text.size()]);
    }
    return bytes;
}

}  // namespace

boost::shared_ptr<const Sound::SoundDataBuffer> makeLightBuffer(int session, int milliseconds) {
    return makeBuffer(makeBytes(session, LIGHT_BYTES), SAMPLE_RATE_HZ / 1000 * milliseconds);
}

boost::shared_ptr<const Sound::SoundDataBuffer> makeWholeBuffer(int session) {
    const int samples = SAMPLE_RATE_HZ / 1000 * SHORT_BUFFER_MS;
    return makeBuffer(makeBytes(session, static_cast<std::size_t>(samples) * 2), samples);
}

boost::shared_ptr<const Sound::SoundDataBuffer> makeOddBuffer(int kind) {
    switch (kind) {
        case 0:
            return makeBuffer({}, 0);
        case 1:
            return makeBuffer(Bytes(33, 1), 16);
        case 2:
            return makeBuffer(Bytes(320, 2), 160, 0);
        case 3:
            return makeBuffer(Bytes(1600, 3), 800, 8000);
        case 4:
            return makeBuffer(Bytes(640, 4), 160, SAMPLE_RATE_HZ, 2);
        case 5:
            return makeBuffer(Bytes(32, 5), 1000000000);
        case 6:
            return makeBuffer(Bytes(3200, 6), -1);
        default:
            return makeBuffer(Bytes(2, 7), 1);
    }
}

}  // namespace Lifecycle
