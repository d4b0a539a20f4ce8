#pragma once

#include <optional>
#include <string>

#include "Check.h"
#include "HttpProbe.h"

namespace Cli {

/** The header with the results, in lower case. */
extern const char* const RESULTS_HEADER;
/** The header with the gateway's report of arrivals, in lower case. */
extern const char* const ARRIVALS_HEADER;

/** Judges what has nothing to do with what was sent: no answer at all. */
std::optional<Check> findNoAnswer(const std::string& name, const ProbeResult& result,
                                  int timeoutMs);

/** Judges an answer to a request with sound. @return nothing for an answer with results */
std::optional<Check> findFault(const std::string& name, const ProbeResult& result, int timeoutMs);

/** "status 404", and the answer's first line if it explains itself. */
std::string statusText(const ProbeResult& result);

}  // namespace Cli
