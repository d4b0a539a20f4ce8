#pragma once

#include <nlohmann/json.hpp>
#include <ostream>
#include <string>
#include <vector>

#include "CorpusScore.h"
#include "Statistics.h"

namespace Cli {

/** One row of a score: some of the sounds with one setup. */
struct ScoreRow {
    std::string vad;
    std::string kind; /**< "all", "group" or "pause" */
    std::string name;
    Statistics statistics;
};

/**
 * The rows of each setup: all sounds, then each group, then the sounds with speech by the longest
 * pause inside it.
 */
std::vector<ScoreRow> makeRows(const std::vector<ScoredSound>& sounds,
                               const std::vector<DetectorSetup>& setups);

/** One row as `--json` prints it and as a report holds it. */
nlohmann::ordered_json toJson(const ScoreRow& row);

/** A latency as a JSON number, "never" for `NEVER`, null for none. */
nlohmann::ordered_json latencyToJson(double ms);

void printRows(const std::vector<ScoreRow>& rows, std::ostream& out);
void printRowsAsJson(const std::vector<ScoreRow>& rows, std::ostream& out);
void printRowsAsCsv(const std::vector<ScoreRow>& rows, std::ostream& out);

/** A text as a field of a CSV line. */
std::string csvField(const std::string& text);

/** "850", "never" or, where there is none, "-". */
std::string latencyText(double ms);

/** A share in percent, such as "12.5"; "-" for none. */
std::string percentText(double share);

/** What a reader sees for a parameter text. */
std::string settingName(const std::string& vad);

}  // namespace Cli
