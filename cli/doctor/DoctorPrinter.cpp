#include "DoctorPrinter.h"

#include <algorithm>
#include <cmath>

#include "cli/JsonEvents.h"
#include "cli/Text.h"

namespace Cli {

namespace {

const std::size_t VERDICT_COLUMNS = 9;
const std::size_t NAME_COLUMNS = 12;
const int TIME_COLUMNS = 6;
const int TIME_DECIMALS = 1;

const char* verdictName(Check::Verdict verdict) {
    switch (verdict) {
        case Check::WELL:
            return "well";
        case Check::PROBLEM:
            return "problem";
        case Check::UNKNOWN:
            return "unknown";
        default:
            return "skipped";
    }
}

/** Times are measured to the microsecond; more digits would say nothing. */
Json toJson(double value) {
    const double rounded = std::round(value * 1000) / 1000;
    return std::floor(rounded) == rounded ? Json(std::llround(rounded)) : Json(rounded);
}

}  // namespace

void printCheck(const Check& check, std::ostream& out) {
    const std::string time = check.ms ? fixed(*check.ms, TIME_COLUMNS, TIME_DECIMALS) + " ms"
                                      : std::string(TIME_COLUMNS + 3, ' ');
    out << padded(verdictName(check.verdict), VERDICT_COLUMNS) << padded(check.name, NAME_COLUMNS)
        << time << "  " << printable(check.finding) << '\n';
    if (!check.advice.empty()) {
        out << std::string(VERDICT_COLUMNS + NAME_COLUMNS + time.size() + 2, ' ')
            << printable(check.advice) << '\n';
    }
    out.flush();
}

std::string checksJson(const std::string& url, const std::vector<Check>& checks) {
    Json list = Json::array();
    for (const Check& check : checks) {
        Json object;
        object["check"] = check.name;
        object["verdict"] = verdictName(check.verdict);
        object["finding"] = printable(check.finding);
        if (!check.advice.empty()) {
            object["advice"] = check.advice;
        }
        if (check.ms) {
            object["ms"] = toJson(*check.ms);
        }
        for (const auto& figure : check.figures) {
            object[figure.first] = toJson(figure.second);
        }
        list.push_back(object);
    }
    Json report;
    report["url"] = url;
    report["well"] = isAllWell(checks);
    report["checks"] = list;
    return toJsonLine(report);
}

bool isAllWell(const std::vector<Check>& checks) {
    return std::all_of(checks.begin(), checks.end(), [](const Check& check) {
        return check.verdict == Check::WELL || check.verdict == Check::SKIPPED;
    });
}

}  // namespace Cli
