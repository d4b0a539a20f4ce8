#include "DoctorCommand.h"

#include <CLI/CLI.hpp>

#include "DoctorPrinter.h"
#include "ProbeRequests.h"
#include "ReachChecks.h"
#include "RequestChecks.h"
#include "cli/Address.h"
#include "cli/CertificateFile.h"
#include "cli/ExitStatus.h"
#include "cli/UsageError.h"

namespace Cli {

namespace {

const int TIMEOUT_S_MAX = 600;
const int IDLE_S_MAX = 3600;
const char* const PATH_ENDING = "/asrgw";

CLI::App* addDoctor(CLI::App& tool, DoctorOptions& options) {
    CLI::App* command = tool.add_subcommand(
        "doctor",
        "Check the way to a gateway: name, connection, TLS, and what fronts do to "
        "requests");
    command->add_option("url", options.url, "Address of the gateway")->type_name("URL")->required();
    command
        ->add_option("--ca-file", options.certificateFile,
                     "PEM file with certificate authorities to trust for https addresses beside "
                     "the system's")
        ->type_name("FILE");
    command->add_option("--uuid", options.uuid, "Identifier of this installation [random]")
        ->type_name("TEXT");
    command->add_option("--lang", options.language, "Language of the requests [en-US]")
        ->type_name("TEXT");
    command
        ->add_option("--timeout", options.timeoutS, "Longest wait for the server, in seconds [20]")
        ->type_name("S")
        ->check(CLI::Range(1, TIMEOUT_S_MAX).description(""));
    command
        ->add_option("--idle", options.idleS,
                     "How long to watch a kept connection, in seconds; 0 for not at all [6]")
        ->type_name("S")
        ->check(CLI::Range(0, IDLE_S_MAX).description(""));
    command->add_flag("--json", options.json, "Print one JSON object at the end");
    command->footer(
        "Sends requests without sound, a generated utterance of 2 s whole and at the pace of\n"
        "speech, and 20 s of silence. Figures of a check are times in milliseconds.\n"
        "Exit status: 0 all is well, 1 there is a problem or something could not be found out,\n"
        "2 wrong usage.");
    return command;
}

/** The checks in their order; each needs those before it. */
class Examination {
  public:
    Examination(const DoctorOptions& doctorOptions, const ProbeTarget& probeTarget,
                std::ostream* progress)
        : options(doctorOptions),
          target(probeTarget),
          requests(doctorOptions.uuid, doctorOptions.language),
          out(progress) {}

    std::vector<Check> run() {
        for (const Check& check : checkReach(target)) {
            add(check);
        }
        if (isStopped || !add(checkPath(target, requests))) {
            return checks;
        }
        add(checkWhole(target, requests));
        add(checkStreamed(target, requests));
        add(checkSize(target, requests));
        add(checkKept(target, requests, options.idleS * 1000));
        return checks;
    }

  private:
    bool add(const Check& check) {
        checks.push_back(check);
        if (out != nullptr) {
            printCheck(check, *out);
        }
        isStopped = isStopped || check.verdict == Check::PROBLEM;
        return check.verdict != Check::PROBLEM;
    }

    const DoctorOptions& options;
    const ProbeTarget& target;
    const ProbeRequests requests;
    std::ostream* const out;
    std::vector<Check> checks;
    bool isStopped = false;
};

std::string withoutPath(const std::string& url) {
    const std::string ending = PATH_ENDING;
    const bool hasPath = url.size() > ending.size() &&
                         url.compare(url.size() - ending.size(), ending.size(), ending) == 0;
    return hasPath ? url.substr(0, url.size() - ending.size()) : url;
}

std::string verdictOf(const std::vector<Check>& checks) {
    std::size_t problems = 0;
    for (const Check& check : checks) {
        problems += check.verdict == Check::PROBLEM ? 1 : 0;
    }
    if (problems > 0) {
        return std::to_string(problems) + (problems == 1 ? " problem" : " problems");
    }
    return isAllWell(checks) ? "all is well" : "no problem found, but not everything is known";
}

}  // namespace

DoctorCommand::DoctorCommand(CLI::App& tool) : command_(addDoctor(tool, options_)) {}

bool DoctorCommand::isParsed() const {
    return command_->parsed();
}

int DoctorCommand::run(Console& console) const {
    DoctorOptions options = options_;
    options.uuid = options.uuid.empty() ? makeUuid() : options.uuid;
    checkUrl(options.url);
    checkQueryValue("uuid", options.uuid);
    if (options.language.empty()) {
        throw UsageError("the language is empty");
    }
    if (!options.certificateFile.empty()) {
        trustAuthoritiesOf(options.certificateFile);
    }
    ProbeTarget target;
    target.url = withoutPath(options.url);
    target.certificateFile = options.certificateFile;
    target.timeoutMs = options.timeoutS * 1000;
    Examination examination(options, target, options.json ? nullptr : &console.out);
    const std::vector<Check> checks = examination.run();
    console.out << (options.json ? checksJson(options.url, checks) : verdictOf(checks)) << '\n';
    return isAllWell(checks) ? EXIT_OK : EXIT_ENDED_IN_ERROR;
}

}  // namespace Cli
