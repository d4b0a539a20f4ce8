#pragma once

#include <string>
#include <vector>

#include "cli/endpoint/Grid.h"
#include "cli/endpoint/ScoreTable.h"
#include "cli/endpoint/SweepTable.h"

namespace Cli {

/** Writes the report on a score. @throws UsageError if the file cannot be written */
void writeScoreReport(const std::string& path, const std::string& folder,
                      const std::vector<ScoreRow>& rows);

/** Writes the report on a sweep. @throws UsageError if the file cannot be written */
void writeSweepReport(const std::string& path, const std::string& folder,
                      const std::vector<GridAxis>& axes, const SweepResult& result);

}  // namespace Cli
