#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "core/sound/Recorder.h"

namespace Cli {

/** How a detector is set up. */
struct DetectorSetup {
    std::string vad; /**< the text of the setting */
    Sound::Recorder::Mode mode = Sound::Recorder::MODE_VOICE_RECOGNITION;
};

/** What happened to a session that listened to a sound; times in ms from the sound's beginning. */
struct Listening {
    enum Ending {
        SOUND_ENDED,  /**< the session still listened at the end of the sound */
        SPEECH_ENDED, /**< the detector found the end of speech */
        NO_VOICE,     /**< 5 s without speech */
        LIMIT_REACHED /**< 20 s of sound */
    };

    /** When the session reports that speech begins; the device's delay is part of it. */
    std::optional<int64_t> speechBeginsMs;
    Ending ending = SOUND_ENDED;
    /** When the session ends; the device's delay is part of it. */
    int64_t endsMs = 0;
    /** The sound that the session recorded; it sends all of it. */
    int64_t recordedMs = 0;
};

/**
 * Lets a session listen to a sound from sample `begin` on: that is `Talvox::VadAnalyzer`, which
 * goes by a session's own rules. A last part that does not fill a buffer is left out, so that no
 * silence is heard that is not in the sound.
 */
Listening listen(const DetectorSetup& setup, const std::vector<int16_t>& samples, int sampleRateHz,
                 std::size_t begin = 0);

}  // namespace Cli
