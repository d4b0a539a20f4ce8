#include "ScoreTable.h"

#include <array>
#include <cmath>
#include <utility>

#include "cli/JsonEvents.h"
#include "cli/Text.h"

namespace Cli {

namespace {

const std::size_t NAME_COLUMNS = 16;

/** A figure of a row and what it is called. */
struct Column {
    const char* name; /**< in JSON and CSV */
    bool isShare;
    Estimate Statistics::*estimate;
};

const std::array<Column, 7>& columns() {
    static const std::array<Column, 7> all = {{
        {"missed", true, &Statistics::missed},
        {"falseBegin", true, &Statistics::falseBegin},
        {"beginLateMs", false, &Statistics::beginLateMs},
        {"early", true, &Statistics::early},
        {"unended", true, &Statistics::unended},
        {"endLateMs", false, &Statistics::endLateMs},
        {"excessMs", false, &Statistics::excessMs},
    }};
    return all;
}

std::string rightAligned(const std::string& text, int columns) {
    const std::size_t used = characterCount(text);
    const auto wanted = static_cast<std::size_t>(columns);
    return used < wanted ? std::string(wanted - used, ' ') + text : ' ' + text;
}

double roundTo(double value, double unit) {
    return std::round(value / unit) * unit;
}

Json numberToJson(double value, bool isShare) {
    if (!isShare) {
        return latencyToJson(value);
    }
    return std::isnan(value) ? Json(nullptr) : Json(roundTo(value * 1e5, 1) / 1e5);
}

std::string csvNumber(double value, bool isShare) {
    const Json number = numberToJson(value, isShare);
    if (number.is_null()) {
        return "";
    }
    return number.is_string() ? number.get<std::string>() : number.dump();
}

std::string pauseName(int64_t pauseMs) {
    const std::array<int64_t, 4> bounds = {0, 500, 1000, 2000};
    const std::array<const char*, 4> names = {"none", "up to 0.5 s", "up to 1 s", "up to 2 s"};
    for (std::size_t index = 0; index < bounds.size(); ++index) {
        if (pauseMs <= bounds[index]) {
            return names[index];
        }
    }
    return "over 2 s";
}

/** The verdicts of a setup on some sounds, by the name of the row. */
using Parts = std::vector<std::pair<std::string, std::vector<Verdict>>>;

void addTo(Parts& parts, const std::string& name, const std::vector<Verdict>& verdicts) {
    for (auto& [known, collected] : parts) {
        if (known == name) {
            collected.insert(collected.end(), verdicts.begin(), verdicts.end());
            return;
        }
    }
    parts.emplace_back(name, verdicts);
}

Parts partsByPause(const std::vector<ScoredSound>& sounds, std::size_t setup) {
    // In this order, whatever the sounds' is.
    Parts parts;
    for (const int64_t pauseMs : {0, 500, 1000, 2000, 2001}) {
        parts.emplace_back(pauseName(pauseMs), std::vector<Verdict>());
    }
    for (const ScoredSound& sound : sounds) {
        if (sound.fault.empty() && sound.hasSpeech) {
            addTo(parts, pauseName(sound.longestPauseMs), sound.bySetup[setup]);
        }
    }
    return parts;
}

Parts partsByGroup(const std::vector<ScoredSound>& sounds, std::size_t setup) {
    Parts parts;
    for (const ScoredSound& sound : sounds) {
        if (sound.fault.empty()) {
            addTo(parts, sound.entry.group, sound.bySetup[setup]);
        }
    }
    return parts;
}

std::vector<Verdict> allVerdicts(const std::vector<ScoredSound>& sounds, std::size_t setup) {
    std::vector<Verdict> verdicts;
    for (const ScoredSound& sound : sounds) {
        if (sound.fault.empty()) {
            verdicts.insert(verdicts.end(), sound.bySetup[setup].begin(),
                            sound.bySetup[setup].end());
        }
    }
    return verdicts;
}

void addRows(std::vector<ScoreRow>& rows, const std::string& vad, const std::string& kind,
             const Parts& parts) {
    for (const auto& [name, verdicts] : parts) {
        if (!verdicts.empty()) {
            rows.push_back({vad, kind, name, summarize(verdicts)});
        }
    }
}

std::string earlyText(const Estimate& early) {
    if (std::isnan(early.value)) {
        return "-";
    }
    return percentText(early.value) + " (" + percentText(early.low) + " to " +
           percentText(early.high) + ')';
}

void printRow(const ScoreRow& row, std::ostream& out) {
    const Statistics& figures = row.statistics;
    const std::string name = row.kind == "pause" ? "pause " + row.name : row.name;
    out << "  " << padded(printable(name), NAME_COLUMNS)
        << rightAligned(std::to_string(figures.sessions), 6)
        << rightAligned(percentText(figures.missed.value), 8)
        << rightAligned(percentText(figures.falseBegin.value), 8)
        << rightAligned(latencyText(figures.beginLateMs.value), 8)
        << rightAligned(latencyText(figures.beginLateP90Ms), 6)
        << rightAligned(earlyText(figures.early), 22)
        << rightAligned(percentText(figures.unended.value), 8)
        << rightAligned(latencyText(figures.endLateMs.value), 8)
        << rightAligned(latencyText(figures.endLateP90Ms), 6)
        << rightAligned(latencyText(figures.excessMs.value), 8) << '\n';
}

void printHead(const std::string& vad, std::ostream& out) {
    out << settingName(printable(vad)) << '\n'
        << "  " << padded("", NAME_COLUMNS) << "        missed   false    begin late"
        << "           ended early   never      end late  excess\n"
        << "  " << padded("", NAME_COLUMNS) << " count       %   begin       ms   p90"
        << "    % (95 % confidence)   ended       ms   p90      ms\n";
}

}  // namespace

std::vector<ScoreRow> makeRows(const std::vector<ScoredSound>& sounds,
                               const std::vector<DetectorSetup>& setups) {
    std::vector<ScoreRow> rows;
    for (std::size_t setup = 0; setup < setups.size(); ++setup) {
        const std::string& vad = setups[setup].vad;
        addRows(rows, vad, "all", {{"all", allVerdicts(sounds, setup)}});
        addRows(rows, vad, "group", partsByGroup(sounds, setup));
        addRows(rows, vad, "pause", partsByPause(sounds, setup));
    }
    return rows;
}

nlohmann::ordered_json latencyToJson(double ms) {
    if (std::isnan(ms)) {
        return nullptr;
    }
    return std::isinf(ms) ? Json("never") : Json(std::llround(ms));
}

nlohmann::ordered_json toJson(const ScoreRow& row) {
    Json object;
    object["event"] = "row";
    object["vad"] = row.vad;
    object["kind"] = row.kind;
    object["name"] = row.name;
    object["sessions"] = row.statistics.sessions;
    object["sessionsWithSpeech"] = row.statistics.sessionsWithSpeech;
    for (const Column& column : columns()) {
        const Estimate& estimate = row.statistics.*column.estimate;
        Json& figure = object[column.name];
        figure["value"] = numberToJson(estimate.value, column.isShare);
        figure["low"] = numberToJson(estimate.low, column.isShare);
        figure["high"] = numberToJson(estimate.high, column.isShare);
    }
    object["beginLateMs"]["p90"] = latencyToJson(row.statistics.beginLateP90Ms);
    object["endLateMs"]["p90"] = latencyToJson(row.statistics.endLateP90Ms);
    return object;
}

void printRows(const std::vector<ScoreRow>& rows, std::ostream& out) {
    for (const ScoreRow& row : rows) {
        if (row.kind == "all") {
            out << (&row == &rows.front() ? "" : "\n");
            printHead(row.vad, out);
        }
        printRow(row, out);
    }
}

void printRowsAsJson(const std::vector<ScoreRow>& rows, std::ostream& out) {
    for (const ScoreRow& row : rows) {
        out << toJsonLine(toJson(row)) << '\n';
    }
}

void printRowsAsCsv(const std::vector<ScoreRow>& rows, std::ostream& out) {
    out << "vad,kind,name,sessions,sessionsWithSpeech";
    for (const Column& column : columns()) {
        out << ',' << column.name << ',' << column.name << "Low," << column.name << "High";
    }
    out << ",beginLateP90Ms,endLateP90Ms\n";
    for (const ScoreRow& row : rows) {
        out << csvField(row.vad) << ',' << row.kind << ',' << csvField(row.name) << ','
            << row.statistics.sessions << ',' << row.statistics.sessionsWithSpeech;
        for (const Column& column : columns()) {
            const Estimate& estimate = row.statistics.*column.estimate;
            for (const double number : {estimate.value, estimate.low, estimate.high}) {
                out << ',' << csvNumber(number, column.isShare);
            }
        }
        out << ',' << csvNumber(row.statistics.beginLateP90Ms, false) << ','
            << csvNumber(row.statistics.endLateP90Ms, false) << '\n';
    }
}

std::string csvField(const std::string& text) {
    if (text.find_first_of(",\"\r\n") == std::string::npos) {
        return text;
    }
    std::string quoted = "\"";
    for (const char character : text) {
        quoted += character;
        quoted += character == '"' ? "\"" : "";
    }
    return quoted + '"';
}

std::string latencyText(double ms) {
    if (std::isnan(ms)) {
        return "-";
    }
    return std::isinf(ms) ? "never" : fixed(ms, 0, 0);
}

std::string percentText(double share) {
    return std::isnan(share) ? "-" : fixed(share * 100, 0, 1);
}

std::string settingName(const std::string& vad) {
    return vad.empty() ? "(defaults)" : vad;
}

}  // namespace Cli
