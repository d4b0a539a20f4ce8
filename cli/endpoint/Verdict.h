#pragma once

#include <cstdint>
#include <optional>
#include <vector>

#include "Listening.h"
#include "cli/corpus/CorpusFiles.h"

namespace Cli {

/** A session's detector set against the labels of the sound. */
struct Verdict {
    bool hasSpeech = false;    /**< of the sound */
    bool isMissed = false;     /**< there was speech, and none was reported */
    bool isEarly = false;      /**< the detector found an end before that of the last word */
    bool isUnended = false;    /**< speech was reported, and no end of it */
    bool isFalseBegin = false; /**< speech was reported before there was any */
    /** From the begin of the first word to the report; none for a false or a missed begin. */
    std::optional<int64_t> beginLateMs;
    /** From the end of the last word to the end of the session, if the detector found it. */
    std::optional<int64_t> endLateMs;
    int64_t excessMs = 0; /**< sound sent before the first and behind the last word */
};

/** @param speech the labels of the sound, in order */
Verdict compare(const Listening& listening, const std::vector<Label>& speech);

/** Length of the pieces in which noise without speech is listened to. */
const int NOISE_PIECE_MS = 5000;

/**
 * Sessions over a sound: one, or in sound without speech one that begins every
 * `NOISE_PIECE_MS`.
 */
std::vector<Verdict> scoreSound(const DetectorSetup& setup, const CorpusSound& sound);

}  // namespace Cli
