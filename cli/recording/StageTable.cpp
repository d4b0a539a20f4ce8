#include "StageTable.h"

#include <cmath>
#include <string>

#include "cli/Text.h"

namespace Cli {

namespace {

const int NUMBER_COLUMNS = 8;

void printNumber(double value, std::ostream& out) {
    const std::string none = std::string(NUMBER_COLUMNS - 1, ' ') + "-";
    out << (std::isnan(value) ? none : fixed(value, NUMBER_COLUMNS, 0));
}

void printFigures(const StageFigures& figures, const char* title, std::ostream& out) {
    printNumber(figures.median, out);
    printNumber(figures.p90, out);
    out << "  " << title << '\n';
}

void printRemarks(const RecordingSummary& summary, std::ostream& out) {
    for (const std::string& remark : summary.remarks) {
        out << remark << '\n';
    }
}

}  // namespace

void printStages(const RecordingSummary& summary, std::ostream& out) {
    out << printable(summary.folder) << ' ' << printable(summary.time) << ' '
        << (summary.outcome.empty() ? "without an end" : printable(summary.outcome)) << '\n';
    printRemarks(summary, out);
    if (!summary.stages.missing.empty()) {
        out << "no times: " << summary.stages.missing << '\n';
        return;
    }
    out << '\n' << padded("", NUMBER_COLUMNS - 2) << "ms  stage\n";
    for (std::size_t i = 0; i < STAGES.size(); ++i) {
        printNumber(static_cast<double>(summary.stages.ms[i]), out);
        out << "  " << STAGES[i].title << '\n';
    }
    printNumber(static_cast<double>(summary.stages.totalMs()), out);
    out << "  total\n";
}

void printStages(const std::vector<RecordingSummary>& summaries, std::ostream& out) {
    const StageStatistics statistics = summarize(summaries);
    out << statistics.sessions << " sessions, " << statistics.measured << " with times\n\n"
        << "  median     p90  stage (ms)\n";
    for (std::size_t i = 0; i < STAGES.size(); ++i) {
        printFigures(statistics.stages[i], STAGES[i].title, out);
    }
    printFigures(statistics.total, "total", out);
    out << "\n   total  slowest (ms)\n";
    for (const std::size_t index : findSlowest(summaries, SLOWEST_COUNT)) {
        printNumber(static_cast<double>(summaries[index].stages.totalMs()), out);
        out << "  " << printable(summaries[index].folder) << '\n';
    }
    for (const RecordingSummary& summary : summaries) {
        if (!summary.stages.missing.empty()) {
            out << printable(summary.folder) << ": no times: " << summary.stages.missing << '\n';
        }
    }
}

}  // namespace Cli
