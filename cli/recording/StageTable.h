#pragma once

#include <ostream>
#include <vector>

#include "RecordingSummary.h"

namespace Cli {

/** Of how many sessions a table or a report names the slowest. */
const std::size_t SLOWEST_COUNT = 10;

/** Prints the stages of one recording. */
void printStages(const RecordingSummary& summary, std::ostream& out);

/** Prints medians, 90th percentiles and the slowest of many recordings. */
void printStages(const std::vector<RecordingSummary>& summaries, std::ostream& out);

}  // namespace Cli
