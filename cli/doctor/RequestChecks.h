#pragma once

#include "Check.h"
#include "ProbeRequests.h"
#include "ProbeTarget.h"

namespace Cli {

/** Checks that both paths of the gateway are there, with requests without sound. */
Check checkPath(const ProbeTarget& target, const ProbeRequests& requests);

/** Sends the utterance whole. */
Check checkWhole(const ProbeTarget& target, const ProbeRequests& requests);

/**
 * Sends the utterance at the pace of speech and compares that with the gateway's report of when it
 * arrived. Something on the way that collects the request is a problem if two requests show it.
 */
Check checkStreamed(const ProbeTarget& target, const ProbeRequests& requests);

/** Sends a body as long as those of the longest session, and looks for the limit if it fails. */
Check checkSize(const ProbeTarget& target, const ProbeRequests& requests);

/** Watches a connection for `idleMs` after an answer. */
Check checkKept(const ProbeTarget& target, const ProbeRequests& requests, int idleMs);

}  // namespace Cli
