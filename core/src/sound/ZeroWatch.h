#pragma once

#include <cstdint>

#include "core/sound/SoundDataBuffer.h"

namespace Sound {

/** Notices a microphone that delivers nothing but zeros, which no live one does. */
class ZeroWatch {
  public:
    /** Looks at the next recorded buffer. @return true once: zeros alone for over a second */
    bool isSuspicious(const SoundDataBuffer& buffer);

  private:
    int64_t zeroSamples = 0;
    bool reported = false;
};

}  // namespace Sound
