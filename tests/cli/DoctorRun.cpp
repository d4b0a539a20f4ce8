#include "DoctorRun.h"

#include <gtest/gtest.h>

#include "support/ChildProcess.h"

namespace TestSupport {

nlohmann::json DoctorResult::report() const {
    return nlohmann::json::parse(output, nullptr, false);
}

nlohmann::json DoctorResult::check(const std::string& name) const {
    for (const nlohmann::json& check : report().value("checks", nlohmann::json::array())) {
        if (check["check"] == name) {
            return check;
        }
    }
    return nlohmann::json::object();
}

std::string DoctorResult::verdict(const std::string& name) const {
    return check(name).value("verdict", "");
}

std::string DoctorResult::words(const std::string& name) const {
    const nlohmann::json found = check(name);
    return found.value("finding", "") + "\n" + found.value("advice", "");
}

std::string DoctorResult::names() const {
    std::string text;
    for (const nlohmann::json& check : report().value("checks", nlohmann::json::array())) {
        text += (text.empty() ? "" : " ") + check.value("check", "");
    }
    return text;
}

DoctorResult runDoctor(const std::string& url, const std::vector<std::string>& more) {
    // Not ToolProcess: on a busy machine the one line of output may take minutes.
    std::vector<std::string> command = {TALVOX_BINARY, "doctor", url, "--json"};
    command.insert(command.end(), more.begin(), more.end());
    const ChildProcess::Result run = ChildProcess::run(command);
    DoctorResult result;
    result.status = run.exitStatus;
    result.output = run.output;
    EXPECT_TRUE(result.report().is_object()) << run.output;
    return result;
}

}  // namespace TestSupport
