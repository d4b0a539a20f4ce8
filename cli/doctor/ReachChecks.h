#pragma once

#include <vector>

#include "Check.h"
#include "ProbeTarget.h"

namespace Cli {

/**
 * Checks the name, the connection and, for an https address, TLS, without sending a request. Stops
 * at the first problem.
 */
std::vector<Check> checkReach(const ProbeTarget& target);

}  // namespace Cli
