#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "Recording.h"
#include "Stages.h"

namespace Cli {

/** What a table says of one recording. */
struct RecordingSummary {
    std::string folder;
    std::string time;    /**< calendar time of its start, as recorded */
    std::string outcome; /**< "results", or the name of the error; empty without a terminal event */
    StageTimes stages;
    std::vector<std::string> remarks;
};

/** Median and 90th percentile, NaN without values. */
struct StageFigures {
    double median = 0;
    double p90 = 0;
};

/** What many recordings come to; those without stages do not count. */
struct StageStatistics {
    int sessions = 0;
    int measured = 0;
    std::array<StageFigures, STAGES.size()> stages;
    StageFigures total;
};

RecordingSummary summarize(const Recording& recording);

StageStatistics summarize(const std::vector<RecordingSummary>& summaries);

/** Indices of the measured recordings, slowest first; at most `count`. */
std::vector<std::size_t> findSlowest(const std::vector<RecordingSummary>& summaries,
                                     std::size_t count);

/** As `--json` prints it and as a report holds it. */
nlohmann::ordered_json toJson(const RecordingSummary& summary);
nlohmann::ordered_json toJson(const StageStatistics& statistics);

}  // namespace Cli
