#pragma once

#include <cstddef>
#include <string>

#include "RecordedSession.h"

namespace Cli {

/** What a replay has found. */
struct ReplayResult {
    std::string difference; /**< the first one in words; empty when all events are equal */
    std::size_t events = 0; /**< that the recording has */
};

/**
 * Lets the engine run a recorded session again, on the hand-driven clock, and compares its events
 * with the recorded ones: their order, content, and place among all that came into the session.
 * An event that a timer causes may have come late in the recording, by a second at most.
 *
 * Replaces the engine's settings, transport, recorder factory and session observer meanwhile, and
 * restores their defaults.
 * @throws UsageError when the recording cannot be replayed
 */
ReplayResult replay(const RecordedSession& recorded);

}  // namespace Cli
