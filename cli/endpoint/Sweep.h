#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include "CorpusScore.h"
#include "Statistics.h"

namespace Cli {

/** One point of a sweep. */
struct SweepPoint {
    std::string vad;
    Statistics statistics; /**< over all sounds, without bounds */
    /** No other point loses fewer words without a later end, or ends sooner without losing more. */
    bool isPareto = false;

    double lost() const;
};

/** What is wanted of a setting. */
struct Wanted {
    std::optional<double> lost;       /**< the highest share of sessions that lose words */
    std::optional<double> latencyMs;  /**< the latest end, as median */
    std::optional<double> falseBegin; /**< the highest share of false begins */
};

/** The point that fits best, and how it does on sounds that did not choose it. */
struct Advice {
    std::size_t point = 0;    /**< chosen by all sounds */
    bool meetsWanted = false; /**< on the sounds that chose it */
    Statistics heldOut;       /**< each part of the sounds with the point that the others chose */
    int folds = 0;
    int foldsThatAgree = 0; /**< in so many of them the others chose this point as well */
};

/** Sessions with speech that lose words: those that end early and those that never begin. */
double lostShare(const Statistics& statistics);

/** The figures of all points, in their order, with the best trade-offs marked. */
std::vector<SweepPoint> makePoints(const std::vector<ScoredSound>& sounds,
                                   const std::vector<DetectorSetup>& setups);

/**
 * Chooses the point that has the lowest latency within the wanted bounds; with a bound on the
 * latency, the one that loses fewest words. If no point meets the bounds, the one that is least
 * far from them. Judged by cross-validation with five parts; sounds with the same file name are in
 * the same part, because they have the same speech in a generated corpus.
 */
Advice advise(const std::vector<ScoredSound>& sounds, const std::vector<SweepPoint>& points,
              const Wanted& wanted);

}  // namespace Cli
