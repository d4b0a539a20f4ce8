#include "EndpointReport.h"

#include "Report.h"
#include "cli/JsonEvents.h"
#include "cli/Version.h"

namespace Cli {

namespace {

Json makeData(const char* report, const std::string& folder) {
    return {{"report", report}, {"version", versionText()}, {"folder", folder}};
}

}  // namespace

void writeScoreReport(const std::string& path, const std::string& folder,
                      const std::vector<ScoreRow>& rows) {
    Json data = makeData("score", folder);
    Json& list = data["rows"] = Json::array();
    for (const ScoreRow& row : rows) {
        list.push_back(toJson(row));
    }
    writeReport(path, "Score of " + folder, data);
}

void writeSweepReport(const std::string& path, const std::string& folder,
                      const std::vector<GridAxis>& axes, const SweepResult& result) {
    Json data = makeData("sweep", folder);
    Json& names = data["axes"] = Json::array();
    for (const GridAxis& axis : axes) {
        names.push_back({{"name", axis.name}, {"values", axis.values}});
    }
    Json& points = data["points"] = Json::array();
    for (const SweepPoint& point : result.points) {
        points.push_back(toJson(point));
    }
    data["advice"] = adviceToJson(result);
    writeReport(path, "Sweep of " + folder, data);
}

}  // namespace Cli
