#include "RecordingSummary.h"

#include <algorithm>
#include <cmath>

#include "cli/endpoint/Statistics.h"

namespace Cli {

namespace {

using Json = nlohmann::ordered_json;

const double SHARE_P90 = 0.9;

StageFigures makeFigures(std::vector<double> values) {
    StageFigures figures;
    figures.median = quantile(values, 0.5);
    figures.p90 = quantile(values, SHARE_P90);
    return figures;
}

Json numberJson(double value) {
    return std::isnan(value) ? Json(nullptr) : Json(static_cast<int64_t>(value));
}

Json toJson(const StageFigures& figures) {
    return {{"median", numberJson(figures.median)}, {"p90", numberJson(figures.p90)}};
}

std::string findOutcome(const Recording& recording) {
    for (const Json& line : recording.lines) {
        std::string event = textOf(line, "kind") == "event" ? textOf(line, "event") : "";
        if (event == "results") {
            return event;
        }
        if (event == "error") {
            const std::string name = textOf(line, "name");
            return name.empty() ? event : name;
        }
    }
    return std::string();
}

}  // namespace

RecordingSummary summarize(const Recording& recording) {
    RecordingSummary summary;
    summary.folder = recording.folder;
    summary.time = textOf(recording.session, "time");
    summary.outcome = findOutcome(recording);
    summary.stages = measureStages(recording);
    summary.remarks = recording.remarks;
    if (summary.stages.missing.empty() && !summary.stages.knowsSpeechEnd) {
        summary.remarks.emplace_back(
            "The end of speech is not known without sound; the times begin where recording stops.");
    }
    return summary;
}

StageStatistics summarize(const std::vector<RecordingSummary>& summaries) {
    StageStatistics statistics;
    std::array<std::vector<double>, STAGES.size()> stages;
    std::vector<double> totals;
    for (const RecordingSummary& summary : summaries) {
        ++statistics.sessions;
        if (!summary.stages.missing.empty()) {
            continue;
        }
        ++statistics.measured;
        totals.push_back(static_cast<double>(summary.stages.totalMs()));
        for (std::size_t i = 0; i < stages.size(); ++i) {
            stages[i].push_back(static_cast<double>(summary.stages.ms[i]));
        }
    }
    for (std::size_t i = 0; i < stages.size(); ++i) {
        statistics.stages[i] = makeFigures(stages[i]);
    }
    statistics.total = makeFigures(totals);
    return statistics;
}

std::vector<std::size_t> findSlowest(const std::vector<RecordingSummary>& summaries,
                                     std::size_t count) {
    std::vector<std::size_t> slowest;
    for (std::size_t i = 0; i < summaries.size(); ++i) {
        if (summaries[i].stages.missing.empty()) {
            slowest.push_back(i);
        }
    }
    std::stable_sort(slowest.begin(), slowest.end(), [&](std::size_t one, std::size_t other) {
        return summaries[one].stages.totalMs() > summaries[other].stages.totalMs();
    });
    slowest.resize(std::min(slowest.size(), count));
    return slowest;
}

Json toJson(const RecordingSummary& summary) {
    Json json = {{"folder", summary.folder}, {"time", summary.time}, {"outcome", summary.outcome}};
    const StageTimes& times = summary.stages;
    if (times.missing.empty()) {
        json["knowsSpeechEnd"] = times.knowsSpeechEnd;
        json["beginMs"] = times.beginMs;
        json["endMs"] = times.endMs;
        for (std::size_t i = 0; i < STAGES.size(); ++i) {
            json["stages"][STAGES[i].name] = times.ms[i];
        }
        json["totalMs"] = times.totalMs();
    } else {
        json["missing"] = times.missing;
    }
    json["remarks"] = summary.remarks;
    return json;
}

Json toJson(const StageStatistics& statistics) {
    Json json = {{"sessions", statistics.sessions}, {"measured", statistics.measured}};
    for (std::size_t i = 0; i < STAGES.size(); ++i) {
        json["stages"][STAGES[i].name] = toJson(statistics.stages[i]);
    }
    json["total"] = toJson(statistics.total);
    return json;
}

}  // namespace Cli
