#pragma once

#include <cstdint>
#include <functional>
#include <ostream>
#include <string>
#include <vector>

#include "Verdict.h"

namespace Cli {

class SweepStore;

/** What each setup makes of one sound. */
struct ScoredSound {
    CorpusEntry entry;
    std::string fault; /**< why the sound could not be scored; empty if it was */
    int64_t soundMs = 0;
    bool hasSpeech = false;
    int64_t longestPauseMs = 0; /**< between two labels */
    int64_t tailMs = 0;         /**< behind the last label */
    std::vector<std::vector<Verdict>> bySetup;
};

/** How a corpus is scored. */
struct ScoreRun {
    std::vector<DetectorSetup> setups;
    unsigned threads = 0;                /**< 0 for as many as there are processors */
    SweepStore* store = nullptr;         /**< keeps what is scored for a later run; may be null */
    std::function<void(double)> onSound; /**< called with the share that is done; any thread */
};

/** Scores every sound with every setup, in the order of the entries. */
std::vector<ScoredSound> scoreCorpus(const std::vector<CorpusEntry>& entries, const ScoreRun& run);

/** Leaves out the sounds with a longer pause inside the speech. */
void dropLongPauses(std::vector<ScoredSound>& sounds, int64_t pauseMaxMs);

/**
 * Writes a line for each sound that could not be scored, and one if the tails of others are too
 * short to show a late end. @return the number of sounds that could not be scored
 */
int reportFaults(const std::vector<ScoredSound>& sounds, std::ostream& err);

}  // namespace Cli
