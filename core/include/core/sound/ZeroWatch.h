/**
 * @file
 * Notices a muted microphone.
 */
#pragma once

#include <cstdint>

#include "core/Export.h"
#include "core/sound/SoundDataBuffer.h"

namespace Sound {

/** Notices a microphone that delivers nothing but zeros, which no live one does. */
class KORVEL_CORE_API ZeroWatch {
  public:
    /** Looks at the next recorded buffer. @return true once: zeros alone for over a second */
    bool isSuspicious(const SoundDataBuffer& buffer);

    /** True when every sample is zero: digital silence. */
    static bool isSilence(const SoundDataBuffer& buffer);

  private:
    int64_t zeroSamples = 0;
    bool reported = false;
};

}  // namespace Sound
