#include "ArrivalReport.h"

#include <algorithm>
#include <map>
#include <sstream>

namespace Cli {

namespace {

/** The number before an optional "ms"; nothing for another text. */
std::optional<double> readNumber(const std::string& text) {
    const std::size_t digits = std::min(text.find_first_not_of("0123456789"), text.size());
    const std::string unit = text.substr(digits);
    if (digits == 0 || digits > 12 || (!unit.empty() && unit != "ms")) {
        return std::nullopt;
    }
    return static_cast<double>(std::stoll(text.substr(0, digits)));
}

}  // namespace

std::optional<ArrivalReport> ArrivalReport::read(const std::string& text) {
    ArrivalReport report;
    std::map<std::string, double*> missing = {{"pieces", &report.pieces},
                                              {"first", &report.firstMs},
                                              {"last", &report.lastMs},
                                              {"answer", &report.answerMs}};
    std::istringstream words(text);
    for (std::string word; words >> word;) {
        const std::size_t equals = std::min(word.find('='), word.size() - 1);
        const std::string name = word.substr(0, equals);
        const std::optional<double> number = readNumber(word.substr(equals + 1));
        const auto field = missing.find(name);
        if (number && field != missing.end()) {
            *field->second = *number;
            missing.erase(field);
        } else if (number && name == "gap") {
            report.gapMs = *number;
        }
    }
    return missing.empty() ? std::optional<ArrivalReport>(report) : std::nullopt;
}

}  // namespace Cli
