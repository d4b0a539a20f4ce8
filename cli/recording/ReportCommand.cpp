#include "ReportCommand.h"

#include <CLI/CLI.hpp>

#include "Recording.h"
#include "RecordingSummary.h"
#include "StageTable.h"
#include "cli/ExitStatus.h"
#include "cli/JsonEvents.h"
#include "cli/report/RecordingReport.h"

namespace Cli {

namespace {

CLI::App* addReport(CLI::App& tool, ReportOptions& options) {
    CLI::App* command = tool.add_subcommand(
        "report", "Show where the time of recorded sessions went, from the end of speech on");
    command
        ->add_option("folders", options.folders,
                     "Folders of recorded sessions, or folders that hold such folders")
        ->type_name("DIR")
        ->required();
    command
        ->add_option("--output", options.output,
                     "HTML file for charts and tables; one page that needs no network, with the "
                     "sound of the session, or of the slowest ten")
        ->type_name("FILE.html")
        ->check([](const std::string& file) {
            return file.empty() ? "the text is empty" : std::string();
        });
    command->add_flag("--json", options.json, "Print each session as one JSON object a line");
    command->footer(
        "Stages follow each other; one that was over before the stage in front of it takes 0 ms.\n"
        "The end of speech is the end of the last frame that the detector takes for speech; "
        "without\n"
        "sound it is unknown, and the times begin where recording stops.\n"
        "Exit status: 0, or 2 for wrong usage or a folder that is no recording.");
    return command;
}

void print(const std::vector<RecordingSummary>& summaries, bool json, std::ostream& out) {
    if (!json && summaries.size() == 1) {
        printStages(summaries[0], out);
        return;
    }
    if (!json) {
        printStages(summaries, out);
        return;
    }
    for (const RecordingSummary& summary : summaries) {
        out << toJsonLine(toJson(summary)) << '\n';
    }
    if (summaries.size() > 1) {
        out << toJsonLine(toJson(summarize(summaries))) << '\n';
    }
}

}  // namespace

ReportCommand::ReportCommand(CLI::App& tool) : command_(addReport(tool, options_)) {}

bool ReportCommand::isParsed() const {
    return command_->parsed();
}

int ReportCommand::run(Console& console) const {
    std::vector<RecordingSummary> summaries;
    for (const std::string& folder : findRecordings(options_.folders)) {
        summaries.push_back(summarize(Recording(folder)));
    }
    print(summaries, options_.json, console.out);
    if (!options_.output.empty()) {
        writeRecordingReport(options_.output, summaries);
    }
    return EXIT_OK;
}

}  // namespace Cli
