#pragma once

#include <array>
#include <cstdint>
#include <string>

#include "Recording.h"

namespace Cli {

/** A part of the time from the end of speech to the end of the session. */
struct Stage {
    const char* name;  /**< in JSON and in a report's elements */
    const char* title; /**< for readers */
};

/**
 * The stages in their order. Each runs from the end of the one before it to the moment that its
 * comment names, and takes no time if that moment has passed.
 */
const std::array<Stage, 7> STAGES = {{
    // Streamed: the next piece is handed to the network after the buffer with the end of speech
    // has arrived. Whole: that buffer has arrived.
    {"unsent", "sound not yet sent at the end of speech"},
    // The session stops recording.
    {"detector", "detector's wait"},
    // The last piece of sound is encoded.
    {"encoding", "encoding"},
    // The connection of the last attempt is ready; earlier attempts count here.
    {"connection", "connection"},
    // The last piece of the body is handed to the network.
    {"upload", "upload"},
    // The answer is complete.
    {"service", "service"},
    // Listeners get results or an error.
    {"delivery", "delivery"},
}};

/** Where the time of one session went; times in ms since its start. */
struct StageTimes {
    /** Why there are no stages; empty if there are. */
    std::string missing;
    /** False if the end of speech is unknown: then the stages begin where recording stops. */
    bool knowsSpeechEnd = false;
    int64_t beginMs = 0;
    int64_t endMs = 0;
    /** The sum is `endMs - beginMs`. */
    std::array<int64_t, STAGES.size()> ms{};

    int64_t totalMs() const { return endMs - beginMs; }
};

/**
 * Measures the stages of a recording. The end of speech is the end of the last frame that the
 * detector takes for speech before recording stops; the detector runs over the sound once more to
 * find it.
 */
StageTimes measureStages(const Recording& recording);

}  // namespace Cli
