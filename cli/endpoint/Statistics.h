#pragma once

#include <cstdint>
#include <limits>
#include <vector>

#include "Verdict.h"

namespace Cli {

/** A figure with the bounds between which it lies with a confidence of 95 %. */
struct Estimate {
    double value = 0;
    double low = 0;
    double high = 0;
};

/** Stands for the latency of sessions that do not end; larger than every other. */
const double NEVER = std::numeric_limits<double>::infinity();

/**
 * What many sessions come to. Shares run from 0 to 1 and are NaN without sessions to count; the
 * 90th percentile is the time that nine of ten sessions do not exceed.
 */
struct Statistics {
    int sessions = 0;
    int sessionsWithSpeech = 0;
    Estimate missed;     /**< share of the sessions with speech */
    Estimate falseBegin; /**< share of all sessions */
    Estimate early;      /**< share of the sessions with speech */
    Estimate unended;    /**< share of the sessions with speech */
    Estimate beginLateMs;
    double beginLateP90Ms = 0;
    Estimate endLateMs; /**< median; `NEVER` counts for sessions that did not end */
    double endLateP90Ms = 0;
    Estimate excessMs; /**< mean of a session */
};

/**
 * Bounds come from 1,000 resamples of the sessions, with numbers that depend on nothing but how
 * many sessions there are. Resamples of sessions that all agree agree as well, so a share of 0 of n
 * has the upper bound 3/n instead, and one of n of n the lower bound 1 - 3/n.
 * @param verdicts      in an order that does not depend on chance
 * @param withBounds    false saves the time that they take; they are NaN then
 */
Statistics summarize(const std::vector<Verdict>& verdicts, bool withBounds = true);

/**
 * The smallest of the values that at least `share` of them do not exceed; NaN for none. Reorders
 * the values.
 */
double quantile(std::vector<double>& values, double share);

}  // namespace Cli
