/**
 * @file
 * Buffers as recorders make them, and as they should not.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "core/sound/SoundDataBuffer.h"

namespace Lifecycle {

constexpr int SHORT_BUFFER_MS = 100;
constexpr int LONG_BUFFER_MS = 1000;

/**
 * So many milliseconds by its format, but only a few bytes, which name the session: as good as a
 * whole one for all but the detector, and much faster.
 */
boost::shared_ptr<const Sound::SoundDataBuffer> makeLightBuffer(int session, int milliseconds);

/** 100 ms with all their samples. */
boost::shared_ptr<const Sound::SoundDataBuffer> makeWholeBuffer(int session);

/** @param kind 0 to `ODD_SOUND_COUNT` - 1 */
boost::shared_ptr<const Sound::SoundDataBuffer> makeOddBuffer(int kind);

}  // namespace Lifecycle
