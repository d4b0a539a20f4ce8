#pragma once

#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace Cli {

/** What a check of the way to the gateway found. */
struct Check {
    enum Verdict {
        WELL,    /**< as it should be */
        PROBLEM, /**< something that costs time or words */
        UNKNOWN, /**< the check could not tell */
        SKIPPED, /**< the check does not apply, or the user switched it off */
    };

    Check(std::string checkName, Verdict checkVerdict, std::string checkFinding,
          std::string checkAdvice = "")
        : name(std::move(checkName)),
          verdict(checkVerdict),
          finding(std::move(checkFinding)),
          advice(std::move(checkAdvice)) {}

    std::string name;
    Verdict verdict;
    std::string finding;      /**< one sentence */
    std::string advice;       /**< what to do; empty for nothing */
    std::optional<double> ms; /**< how long it took */
    /** What was measured, by name: numbers as they are, times in milliseconds. */
    std::vector<std::pair<std::string, double>> figures;
};

}  // namespace Cli
