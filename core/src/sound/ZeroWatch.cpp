#include "core/sound/ZeroWatch.h"

#include <algorithm>

namespace Sound {

bool ZeroWatch::isSilence(const SoundDataBuffer& buffer) {
    const auto& bytes = buffer.getData();
    return std::all_of(bytes.begin(), bytes.end(), [](unsigned char byte) { return byte == 0; });
}

bool ZeroWatch::isSuspicious(const SoundDataBuffer& buffer) {
    zeroSamples = isSilence(buffer) ? zeroSamples + buffer.getSampleCount() : 0;
    if (reported || zeroSamples <= buffer.getInfo().getSampleRate()) {
        return false;
    }
    reported = true;
    return true;
}

}  // namespace Sound
