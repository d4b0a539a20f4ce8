#include "SweepTable.h"

#include <algorithm>
#include <cmath>

#include "ScoreTable.h"
#include "cli/JsonEvents.h"
#include "cli/Text.h"

namespace Cli {

namespace {

Json shareToJson(double share) {
    return std::isnan(share) || std::isinf(share) ? Json(nullptr)
                                                  : Json(std::round(share * 1e5) / 1e5);
}

std::string rightAligned(const std::string& text, std::size_t columns) {
    const std::size_t used = characterCount(text);
    return used < columns ? std::string(columns - used, ' ') + text : ' ' + text;
}

void printPoint(const std::string& name, std::size_t columns, const Statistics& figures,
                std::ostream& out) {
    out << "  " << padded(name, columns) << rightAligned(percentText(lostShare(figures)), 8)
        << rightAligned(percentText(figures.early.value), 8)
        << rightAligned(percentText(figures.missed.value), 8)
        << rightAligned(percentText(figures.unended.value), 8)
        << rightAligned(percentText(figures.falseBegin.value), 8)
        << rightAligned(latencyText(figures.endLateMs.value), 8)
        << rightAligned(latencyText(figures.endLateP90Ms), 7) << '\n';
}

std::vector<const SweepPoint*> bestPoints(const std::vector<SweepPoint>& points) {
    std::vector<const SweepPoint*> best;
    for (const SweepPoint& point : points) {
        if (point.isPareto) {
            best.push_back(&point);
        }
    }
    std::stable_sort(best.begin(), best.end(), [](const SweepPoint* left, const SweepPoint* right) {
        return left->statistics.endLateMs.value < right->statistics.endLateMs.value;
    });
    return best;
}

std::string wantedText(const Wanted& wanted) {
    std::string text;
    const auto add = [&text](const std::string& part) {
        text += text.empty() ? "" : ", ";
        text += part;
    };
    if (wanted.lost) {
        add("words lost in at most " + percentText(*wanted.lost) + " %");
    }
    if (wanted.latencyMs) {
        add("end at most " + latencyText(*wanted.latencyMs) + " ms late");
    }
    if (wanted.falseBegin) {
        add("false begins in at most " + percentText(*wanted.falseBegin) + " %");
    }
    return text;
}

}  // namespace

nlohmann::ordered_json toJson(const SweepPoint& point) {
    const Statistics& figures = point.statistics;
    Json object;
    object["event"] = "point";
    object["vad"] = point.vad;
    object["lost"] = shareToJson(point.lost());
    object["early"] = shareToJson(figures.early.value);
    object["missed"] = shareToJson(figures.missed.value);
    object["unended"] = shareToJson(figures.unended.value);
    object["falseBegin"] = shareToJson(figures.falseBegin.value);
    object["endLateMs"] = latencyToJson(figures.endLateMs.value);
    object["endLateP90Ms"] = latencyToJson(figures.endLateP90Ms);
    object["pareto"] = point.isPareto;
    return object;
}

nlohmann::ordered_json adviceToJson(const SweepResult& result) {
    const Advice& advice = result.advice;
    Json object;
    object["event"] = "advice";
    object["vad"] = result.points[advice.point].vad;
    object["meetsWanted"] = advice.meetsWanted;
    Json& heldOut = object["heldOut"];
    heldOut["lost"] = shareToJson(lostShare(advice.heldOut));
    heldOut["early"] = shareToJson(advice.heldOut.early.value);
    heldOut["earlyLow"] = shareToJson(advice.heldOut.early.low);
    heldOut["earlyHigh"] = shareToJson(advice.heldOut.early.high);
    heldOut["missed"] = shareToJson(advice.heldOut.missed.value);
    heldOut["falseBegin"] = shareToJson(advice.heldOut.falseBegin.value);
    heldOut["endLateMs"] = latencyToJson(advice.heldOut.endLateMs.value);
    heldOut["endLateP90Ms"] = latencyToJson(advice.heldOut.endLateP90Ms);
    object["folds"] = advice.folds;
    object["foldsThatAgree"] = advice.foldsThatAgree;
    return object;
}

void printSweep(const SweepResult& result, std::ostream& out) {
    std::vector<const SweepPoint*> best = bestPoints(result.points);
    std::size_t columns = 12;
    for (const SweepPoint* point : best) {
        columns = std::max(columns, characterCount(point->vad) + 1);
    }
    const SweepPoint& advised = result.points[result.advice.point];
    columns = std::max(columns, characterCount(advised.vad) + 1);
    out << result.points.size() << " points; the best trade-offs of words lost (ended early or "
        << "missed) against latency:\n"
        << "  " << padded("", columns) << "    lost   early  missed   never   false    end late\n"
        << "  " << padded("", columns)
        << "       %       %       %   ended   begin      ms    p90\n";
    for (const SweepPoint* point : best) {
        printPoint(printable(point->vad), columns, point->statistics, out);
    }
    out << "\nwanted: " << wantedText(result.wanted) << '\n'
        << (result.advice.meetsWanted ? "what to set:" : "no point meets that; the nearest is:")
        << '\n';
    printPoint(printable(advised.vad), columns, advised.statistics, out);
    printPoint("held out", columns, result.advice.heldOut, out);
    out << "  " << result.advice.foldsThatAgree << " of " << result.advice.folds
        << " parts choose the same point; held out: early "
        << percentText(result.advice.heldOut.early.value) << " % ("
        << percentText(result.advice.heldOut.early.low) << " to "
        << percentText(result.advice.heldOut.early.high) << ")\n";
}

void printSweepAsJson(const SweepResult& result, std::ostream& out) {
    for (const SweepPoint& point : result.points) {
        out << toJsonLine(toJson(point)) << '\n';
    }
    out << toJsonLine(adviceToJson(result)) << '\n';
}

void printSweepAsCsv(const SweepResult& result, std::ostream& out) {
    bool isFirst = true;
    for (const SweepPoint& point : result.points) {
        std::string head;
        std::string line;
        const Json object = toJson(point);
        for (const auto& [name, value] : object.items()) {
            if (name == "event") {
                continue;
            }
            head += head.empty() ? "" : ",";
            head += name;
            line += line.empty() ? "" : ",";
            line += value.is_string() ? csvField(value.get<std::string>())
                                      : (value.is_null() ? "" : value.dump());
        }
        out << (isFirst ? head + '\n' : "") << line << '\n';
        isFirst = false;
    }
}

}  // namespace Cli
