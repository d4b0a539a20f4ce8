#pragma once

#include <string>
#include <vector>

#include "cli/recording/RecordingSummary.h"

namespace Cli {

/**
 * Writes a page about recorded sessions: the stages of all, and in detail the only one or the
 * slowest, which it reads once more.
 * @throws UsageError if the file cannot be written or a recording cannot be read any more
 */
void writeRecordingReport(const std::string& path, const std::vector<RecordingSummary>& summaries);

}  // namespace Cli
