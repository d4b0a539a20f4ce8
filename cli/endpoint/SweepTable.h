#pragma once

#include <nlohmann/json.hpp>
#include <ostream>
#include <string>
#include <vector>

#include "Sweep.h"

namespace Cli {

/** What a sweep found. */
struct SweepResult {
    std::vector<SweepPoint> points;
    Advice advice;
    Wanted wanted;
};

/** A point as `--json` prints it and as a report holds it. */
nlohmann::ordered_json toJson(const SweepPoint& point);

/** The advice as `--json` prints it and as a report holds it. */
nlohmann::ordered_json adviceToJson(const SweepResult& result);

void printSweep(const SweepResult& result, std::ostream& out);
void printSweepAsJson(const SweepResult& result, std::ostream& out);
void printSweepAsCsv(const SweepResult& result, std::ostream& out);

}  // namespace Cli
