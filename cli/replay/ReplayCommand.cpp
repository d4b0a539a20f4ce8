#include "ReplayCommand.h"

#include <CLI/CLI.hpp>

#include "Replay.h"
#include "cli/ExitStatus.h"
#include "cli/Text.h"

namespace Cli {

ReplayCommand::ReplayCommand(CLI::App& tool)
    : command_(
          tool.add_subcommand("replay", "Run a recorded session again and compare its events")) {
    command_->add_option("folder", folder_, "Folder of one recording, with its session.json")
        ->type_name("DIR")
        ->required();
    command_->add_flag("--verbose", verbose_, "Show what the engine logs meanwhile");
    command_->footer(
        "The engine gets sound, calls and answers as they were recorded, without a network and\n"
        "without waiting. Exit status: 0 all events are equal and come in their place, 1 one is\n"
        "not, 2 wrong usage or not a recording that can be replayed.");
}

bool ReplayCommand::isParsed() const {
    return command_->parsed();
}

int ReplayCommand::run(Console& console, LogOutput& log) const {
    const RecordedSession recorded = readRecording(folder_);
    log.show(verbose_);
    const ReplayResult result = replay(recorded);
    if (result.difference.empty()) {
        console.out << "all " << result.events << " events are equal" << std::endl;
        return EXIT_OK;
    }
    console.out << printable(result.difference) << std::endl;
    return EXIT_ENDED_IN_ERROR;
}

}  // namespace Cli
