#include "EndpointCommand.h"

#include <CLI/CLI.hpp>
#include <set>

#include "VadText.h"
#include "cli/Text.h"
#include "talvox/EndOfSpeech.h"
#include "talvox/Settings.h"
#include "talvox/VadParameters.h"

namespace Cli {

namespace {

const char* const FOLDER_HELP =
    "Folder with sounds, each with an Audacity label file beside it; its folders are the groups";
const int RATE_HZ = 16000;

std::string presetTable() {
    std::string table;
    for (const Talvox::EndOfSpeech& preset : Talvox::EndOfSpeech::all()) {
        table += "  preset:" + padded(preset.name, 10) + ' ' + preset.meaning + "\n    " +
                 preset.parameters + '\n';
    }
    return table;
}

void addCommonOptions(CLI::App& command, EndpointOptions& options) {
    command.add_option("DIR", options.folder, FOLDER_HELP)->required();
    command
        .add_option(
            "--session-mode", options.mode,
            "Mode of the session [" + Talvox::Settings::SESSION_MODE_VOICE_RECOGNITION + "]")
        ->type_name("MODE")
        ->check(CLI::IsMember({Talvox::Settings::SESSION_MODE_VOICE_RECOGNITION,
                               Talvox::Settings::SESSION_MODE_GENERAL}));
    command
        .add_option("--groups", options.groups,
                    "Only these groups, separated by commas, such as clean,white-*")
        ->type_name("NAMES")
        ->delimiter(',');
    command
        .add_option("--pause-max", options.pauseMaxMs,
                    "Leave out sounds with a longer pause inside the speech, in ms [none]")
        ->type_name("MS")
        ->check(CLI::Range(0, 20000).description(""));
    command.add_option("--jobs", options.jobs, "Threads [as many as processors]")
        ->type_name("N")
        ->check(CLI::Range(1, 256).description(""));
    CLI::Option* json =
        command.add_flag("--json", options.json, "Print each row as a JSON object a line");
    command.add_flag("--csv", options.csv, "Print the rows as CSV")->excludes(json);
    command
        .add_option("--report", options.report,
                    "HTML file for charts and tables; one page that needs no network")
        ->type_name("FILE.html");
}

CLI::App* addScore(CLI::App& endpoint, EndpointOptions& options) {
    CLI::App* command = endpoint.add_subcommand(
        "score", "Measure how well the speech detector finds begin and end of speech");
    addCommonOptions(*command, options);
    command
        ->add_option("--vad", options.vads,
                     "Parameters of the speech detector, or preset:NAME; may be repeated")
        ->type_name("TEXT")
        ->allow_extra_args(false);
    command->footer(
        "Each sound with speech is one session; in sound without speech, one begins every 5 s.\n"
        "missed       share of the sessions with speech in which none was reported\n"
        "false begin  share of all sessions in which speech was reported before there was any\n"
        "begin late   from the begin of the first word to the report; median, 90th percentile\n"
        "ended early  share of the sessions with speech that ended before the last word did\n"
        "never ended  share of the sessions with speech that went on to the end of the sound or\n"
        "             to the limit of 20 s\n"
        "end late     from the end of the last word to the end of the session; sessions that\n"
        "             never ended count as later than all others\n"
        "excess       sound sent before the first and behind the last word, mean\n"
        "Confidence intervals are at 95 %, by bootstrap over the sessions.\n\n"
        "Presets:\n" +
        presetTable() +
        "\nExit status: 0 all sounds were scored, 2 wrong usage or sounds that could not be.");
    return command;
}

CLI::App* addSweep(CLI::App& endpoint, EndpointOptions& options) {
    CLI::App* command = endpoint.add_subcommand(
        "sweep", "Score a grid of detector parameters and say which to set");
    addCommonOptions(*command, options);
    command
        ->add_option("--grid", options.grid,
                     "Parameters with a range (first, last, step) or values, such as "
                     "\"analyzems=800:1500:100;aggressiveness=1,2,3\"")
        ->type_name("TEXT")
        ->required();
    command
        ->add_option("--vad", options.vads,
                     "Parameters that stay the same, or preset:NAME; those of the grid replace "
                     "them")
        ->type_name("TEXT")
        ->expected(1);
    command
        ->add_option("--early", options.lost,
                     "Wanted: at most this share of sessions that end early or are missed, such "
                     "as 1%")
        ->type_name("SHARE");
    command
        ->add_option("--latency", options.latencyMs,
                     "Wanted: at most this median of the end's latency in ms")
        ->type_name("MS")
        ->check(CLI::Range(0, 20000).description(""));
    command
        ->add_option("--false-begin", options.falseBegin,
                     "Wanted: at most this share of false begins")
        ->type_name("SHARE");
    command->add_flag(
        "--start-over", options.startsOver,
        "Score every sound, also those that an earlier sweep of this grid has scored");
    command->footer(
        "Prints the best trade-offs of words lost (ended early or missed) against the latency of\n"
        "the end, and the point that meets what is wanted: with --latency the one that loses\n"
        "fewest words, otherwise the one with the earliest end; without any bound, --early 1% is\n"
        "wanted. The point is judged on sounds that did not choose it, in five parts.\n"
        "What is scored is kept in DIR/.talvox-sweep: a sweep that was interrupted goes on where\n"
        "it was when it is started again.\n"
        "Exit status: 0 all sounds were scored, 2 wrong usage or sounds that could not be.");
    return command;
}

}  // namespace

EndpointCommand::EndpointCommand(CLI::App& tool) {
    CLI::App* endpoint =
        tool.add_subcommand("endpoint", "Measure and tune where speech begins and ends");
    endpoint->require_subcommand(1);
    score_ = addScore(*endpoint, options_);
    sweep_ = addSweep(*endpoint, options_);
}

bool EndpointCommand::isParsed() const {
    return score_->parsed() || sweep_->parsed();
}

int EndpointCommand::run(Console& console, LogOutput& log) const {
    // The detector logs every parameter of every session.
    log.show(false);
    return score_->parsed() ? runScore(options_, console) : runSweep(options_, console);
}

std::vector<DetectorSetup> makeSetups(const EndpointOptions& options,
                                      const std::vector<std::string>& vads) {
    const Sound::Recorder::Mode mode = options.mode == Talvox::Settings::SESSION_MODE_GENERAL
                                           ? Sound::Recorder::MODE_GENERAL
                                           : Sound::Recorder::MODE_VOICE_RECOGNITION;
    std::vector<DetectorSetup> setups;
    setups.reserve(vads.size());
    for (const std::string& vad : vads) {
        setups.push_back({vad, mode});
    }
    return setups;
}

void warnOfVadMistakes(const std::vector<DetectorSetup>& setups, std::ostream& err) {
    std::set<std::string> known;
    for (const DetectorSetup& setup : setups) {
        for (const std::string& mistake : Talvox::VadParameters::findMistakes(setup.vad, RATE_HZ)) {
            if (known.insert(mistake).second) {
                err << "talvox: warning: vad: " << printable(mistake) << '\n';
            }
        }
    }
    err.flush();
}

}  // namespace Cli
