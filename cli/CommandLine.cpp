#include "CommandLine.h"

#include <CLI/CLI.hpp>
#include <string>

#include "DetectorPage.h"
#include "ExitStatus.h"
#include "LevelBar.h"
#include "LogCommand.h"
#include "SettingsCommand.h"
#include "SettingsPage.h"
#include "SoundInput.h"
#include "UsageError.h"
#include "VadCommand.h"
#include "VadWarnings.h"
#include "Version.h"
#include "corpus/CorpusCommand.h"
#include "doctor/DoctorCommand.h"
#include "endpoint/EndpointCommand.h"
#include "endpoint/VadText.h"
#include "recording/ReportCommand.h"
#include "replay/ReplayCommand.h"
#include "talvox/Settings.h"

namespace Cli {

namespace {

using Talvox::Settings;

const char* const RATE_HELP =
    "Sample rate in Hz of the recognition, and of raw sound on standard input; at others than "
    "8000, 16000 and 32000 the speech detector takes everything for speech [16000]";

const char* const SETTINGS_PAGE = "settings";
const char* const DETECTOR_PAGE = "detector";

/** What the arguments are read into. */
struct Arguments {
    Arguments() {
        for (SettingsOptions* run : {&recognize.settings, &vad.settings}) {
            run->defaults = recognizeDefaults();
            run->repairDocument = true;
        }
    }

    RecognizeOptions recognize;
    VadOptions vad;
    SettingsOptions settings;
    std::string page;
    LogOptions log;
};

/** Refuses an empty text, which otherwise would stand for an option that is not given. */
std::string checkNotEmpty(const std::string& text) {
    return text.empty() ? "the text is empty" : "";
}

/** Adds an option that names a file or a directory. */
CLI::Option* addPath(CLI::App& command, const std::string& name, std::string& path,
                     const std::string& type, const std::string& help) {
    return command.add_option(name, path, help)
        ->type_name(type)
        ->check(CLI::Validator(checkNotEmpty, ""));
}

CLI::Option* addCertificateFile(CLI::App& command, std::string& path) {
    return addPath(command, "--ca-file", path, "FILE",
                   "PEM file with certificate authorities to trust for https addresses beside the "
                   "system's");
}

/** Adds an option that stands for one setting. */
CLI::Option* addSetting(CLI::App& command, SettingsOptions& settings, const std::string& key,
                        const std::string& name, const std::string& help) {
    return command.add_option_function<std::string>(
        name,
        [&settings, key](const std::string& text) {
            settings.explicitValues.emplace_back(key, text);
        },
        help);
}

CLI::Option* addRate(CLI::App& command, SettingsOptions& settings) {
    return addSetting(command, settings, Settings::SKS_SAMPLE_RATE, "--rate", RATE_HELP)
        ->type_name("HZ")
        ->check(CLI::Range(8000, 44100).description(""));
}

CLI::Option* addVad(CLI::App& command, SettingsOptions& settings) {
    return command
        .add_option_function<std::string>(
            "--vad",
            [&settings](const std::string& text) {
                settings.explicitValues.emplace_back(Settings::SKS_VAD_SETTINGS,
                                                     expandPreset(text));
            },
            "Parameters of the speech detector, such as \"activityon=0.6;framems=20\", or "
            "preset:command, preset:dictation or preset:noisy")
        ->type_name("TEXT");
}

void addLeadInOption(CLI::App& command, int& leadInMs) {
    command
        .add_option("--lead-in", leadInMs,
                    "Silence before a file that begins with speech at once, in milliseconds [" +
                        std::to_string(LEAD_IN_MS_DFLT) + "]")
        ->type_name("MS")
        ->check(CLI::Range(0, LEAD_IN_MS_MAX).description(""));
}

void addSettingsSources(CLI::App& command, SettingsOptions& settings) {
    command
        .add_option(
            "--settings", settings.file,
            "Configuration document whose element " + Settings::XML_PATH_DFLT + " holds settings")
        ->type_name("FILE.xml");
    command
        .add_option("--set", settings.assignments,
                    "Any setting by its key, typed as the settings are; may be repeated")
        ->type_name("KEY=VALUE")
        ->allow_extra_args(false);
}

void addRequestOptions(CLI::App& command, SettingsOptions& settings) {
    addSetting(command, settings, Settings::SKS_URL, "--url",
               "Address of the gateway [http://127.0.0.1:8090]")
        ->type_name("URL");
    addSetting(command, settings, Settings::SKS_UUID, "--uuid",
               "Identifier of this installation, 32 characters [random]")
        ->type_name("TEXT");
    addSetting(command, settings, Settings::RS_LANGUAGE, "--lang", "Language [en-US]")
        ->type_name("TEXT");
    addSetting(command, settings, Settings::RS_MODEL, "--model", "Recognition model [general]")
        ->type_name("TEXT")
        ->check(CLI::IsMember({Settings::MODEL_GENERAL, Settings::MODEL_MAPS,
                               Settings::MODEL_MAPSKVRI, Settings::MODEL_IRONLADY}));
    addSetting(command, settings, Settings::RS_SESSION_ID, "--session-id",
               "The application's session identifier")
        ->type_name("TEXT");
    command.add_flag_function(
        "--streaming,!--no-streaming",
        [&settings](int64_t count) {
            settings.explicitValues.emplace_back(Settings::SKS_STREAMING,
                                                 count > 0 ? "true" : "false");
        },
        "Send the sound while it is recorded, or in one piece afterwards [in one piece]");
    addSetting(command, settings, Settings::SKS_SOUND_FORMAT, "--format",
               "Format in which the sound is sent [pcm_if_wifi]")
        ->check(CLI::IsMember({Settings::SOUND_FORMAT_PCM, Settings::SOUND_FORMAT_PCM_IF_WIFI,
                               Settings::SOUND_FORMAT_SPEEX}));
    addSetting(command, settings, Settings::SKS_SPEEX_QUALITY, "--quality",
               "Speex quality, 0 to 10 [8]")
        ->type_name("N")
        ->check(CLI::Range(0, 10).description(""));
}

CLI::App* addRecognize(CLI::App& app, RecognizeOptions& options) {
    CLI::App* command = app.add_subcommand("recognize", "Recognise what is said");
    CLI::Option* file =
        command
            ->add_option("--file", options.file,
                         "Sound file to play, at its own pace; \"-\" reads a WAV file or raw "
                         "16-bit little-endian mono sound from standard input, at most a minute")
            ->type_name("FILE");
    command
        ->add_flag("--mic", options.microphone,
                   "Record from the default input device instead of playing a file")
        ->excludes(file);
    addLeadInOption(*command, options.leadInMs);
    addRequestOptions(*command, options.settings);
    addCertificateFile(*command, options.certificateFile);
    addVad(*command, options.settings);
    addRate(*command, options.settings);
    addSettingsSources(*command, options.settings);
    addSetting(*command, options.settings, Settings::SKS_VERBOSE_LEVEL, "--verbosity",
               "How much the engine logs to standard error, 0 to 10; with 0 only warnings about "
               "settings and sound appear [0]")
        ->type_name("N")
        ->check(CLI::Range(0, 10).description(""));
    addPath(*command, "--dump", options.dumpDirectory, "DIR",
            "Directory in which the session leaves what it heard, as in.wav");
    CLI::Option* record =
        addPath(*command, "--record", options.recordDirectory, "DIR",
                "Directory in which the session is recorded, in a folder of its own; the oldest "
                "recordings beyond 64 MB are removed");
    command->add_flag("--no-sound", options.noSound, "Leave the sound out of the recording")
        ->needs(record);
    command->add_flag("--json", options.json, "Print every event as one JSON object a line");
    addPath(*command, "--events", options.eventsFile, "FILE",
            "File to which every event is written as with --json, whatever is printed");
    command->footer(
        "Settings are applied in this order: defaults, --settings, --set, the other options.\n"
        "Levels are " +
        levelReference(false) + "; with sessionmode=general,\n" + levelReference(true) +
        ". \"talvox vad --help\" lists the parameters of --vad.\n"
        "Ctrl-C cancels; a second Ctrl-C leaves at once.\n"
        "Exit status: 0 results were delivered, 1 the recognition ended in an error or an output\n"
        "could not be written, 2 wrong usage or unreadable input.");
    return command;
}

/** What no single option can check for itself. */
void checkSource(const RecognizeOptions& options) {
    if (options.file.empty() && !options.microphone) {
        throw UsageError("recognize needs --file FILE or --mic");
    }
}

CLI::App* addVadCommand(CLI::App& app, VadOptions& options) {
    CLI::App* command = app.add_subcommand("vad", "Show what the speech detector decides");
    CLI::Option* file =
        command
            ->add_option("--file", options.file,
                         "Sound file; \"-\" reads a WAV file or raw 16-bit little-endian mono "
                         "sound from standard input, at most an hour")
            ->type_name("FILE");
    command
        ->add_flag("--mic", options.microphone,
                   "Show live what the default input device records, until Ctrl-C, and what a "
                   "session would have sent")
        ->excludes(file);
    addLeadInOption(*command, options.leadInMs);
    command->add_flag("--as-session", options.asSession,
                      "End where a recognition of this sound stops listening (end of speech, 5 s "
                      "without speech, 20 s of sound), with silence behind a file that is shorter, "
                      "and print what it reports, and when");
    addVad(*command, options.settings);
    addRate(*command, options.settings);
    addSettingsSources(*command, options.settings);
    command->add_flag("--json", options.json,
                      "Print every buffer and every segment as one JSON object a line");
    addPath(*command, "--report", options.report, "FILE.html",
            "HTML file for charts and tables; one page that needs no network");
    command->footer("Levels are " + levelReference(false) + "; with sessionmode=general,\n" +
                    levelReference(true) +
                    ". The level of the leading noise, by which the detector\n"
                    "chooses its thresholds, is above -45.3 dBFS and adds the noise up.\n\n"
                    "Parameters of the detector (values, [default]):\n" +
                    vadParameterTable());
    return command;
}

CLI::App* addSettingsCommand(CLI::App& app, SettingsOptions& options, std::string& page) {
    CLI::App* command =
        app.add_subcommand("settings", "Show the settings that would result, as XML");
    addSettingsSources(*command, options);
    command
        ->add_option("--markdown", page,
                     "Print a page about all settings, or about the parameters of the speech "
                     "detector, instead")
        ->check(CLI::IsMember({SETTINGS_PAGE, DETECTOR_PAGE}));
    command->footer(
        "The engine's own defaults, then --settings, then --set; printed as validation leaves\n"
        "them. Each repair is a line on standard error.\n\n"
        "Settings (key, values, [default], effect):\n" +
        settingsHelp());
    return command;
}

int printPage(const std::string& page, std::ostream& out) {
    out << (page == SETTINGS_PAGE ? settingsPage() : detectorPage());
    return EXIT_OK;
}

CLI::App* addLogCommand(CLI::App& app, LogOptions& options) {
    CLI::App* command =
        app.add_subcommand("log", "Send a usage event to a log collection endpoint");
    command
        ->add_option("--url", options.url,
                     "Address of the endpoint [" + LogCollector::LogCollector::URL_DFLT + "]")
        ->type_name("URL");
    addCertificateFile(*command, options.certificateFile);
    command->add_option("--uuid", options.uuid, "Identifier of this installation, as it is [empty]")
        ->type_name("TEXT");
    command->add_option("--session", options.session, "Session that the event belongs to")
        ->type_name("TEXT")
        ->required();
    command->add_flag("--error", options.error, "Send it as an error");
    command
        ->add_option("--store", options.store,
                     "Folder that keeps events until they are delivered; those of earlier calls go "
                     "first [none]")
        ->type_name("DIR")
        ->check([](const std::string& folder) {
            return folder.empty() ? "the folder has no name" : std::string();
        });
    command
        ->add_option("--timeout", options.timeoutS,
                     "How long to wait for the delivery, in seconds [" +
                         std::to_string(LOG_TIMEOUT_S_DFLT) + "]")
        ->type_name("S")
        ->check(CLI::Range(0, LOG_TIMEOUT_S_MAX).description(""));
    command
        ->add_option("--verbosity", options.verbosity,
                     "How much is logged to standard error: 0 nothing, 1 problems, 2 every request "
                     "[" +
                         std::to_string(LOG_VERBOSITY_DFLT) + "]")
        ->type_name("N")
        ->check(CLI::Range(0, LOG_VERBOSITY_MAX).description(""));
    command->add_option("name", options.name, "Name of the event")->type_name("NAME")->required();
    command->add_option("params", options.params, "Parameters of the event")
        ->type_name("KEY=VALUE");
    command->footer(
        "Exit status: 0 all events were delivered, 1 some were not within the time, 2 wrong "
        "usage.\n"
        "With --store, those stay in DIR for the next call. A folder that cannot be used is a "
        "line\n"
        "in the log; the event is sent all the same.");
    return command;
}

int fail(std::ostream& err, const std::string& reason) {
    err << "talvox: " << reason.substr(0, reason.find('\n')) << std::endl;
    return EXIT_USAGE;
}

}  // namespace

int runTool(int argc, const char* const* argv, Console& console, LogOutput& log) {
    Arguments arguments;
    CLI::App app("Speech recognition from the command line", "talvox");
    app.set_version_flag("--version", versionText());
    app.require_subcommand(0, 1);
    const CLI::App* recognize = addRecognize(app, arguments.recognize);
    const CLI::App* vad = addVadCommand(app, arguments.vad);
    const CLI::App* settings = addSettingsCommand(app, arguments.settings, arguments.page);
    const CLI::App* logEvent = addLogCommand(app, arguments.log);
    CorpusCommand corpus(app);
    EndpointCommand endpoint(app);
    const DoctorCommand doctor(app);
    const ReportCommand report(app);
    const ReplayCommand replay(app);
    try {
        app.parse(argc, argv);
        if (recognize->parsed()) {
            checkSource(arguments.recognize);
            return runRecognize(arguments.recognize, console, log);
        }
        if (vad->parsed()) {
            if (arguments.vad.file.empty() && !arguments.vad.microphone) {
                throw UsageError("vad needs --file FILE or --mic");
            }
            return runVad(arguments.vad, console, log);
        }
        if (settings->parsed() && !arguments.page.empty()) {
            return printPage(arguments.page, console.out);
        }
        if (settings->parsed()) {
            return runSettings(arguments.settings, console.out, log);
        }
        if (logEvent->parsed()) {
            return runLog(arguments.log, console, log);
        }
        if (corpus.isParsed()) {
            return corpus.run(console, log);
        }
        if (endpoint.isParsed()) {
            return endpoint.run(console, log);
        }
        if (doctor.isParsed()) {
            return doctor.run(console);
        }
        if (report.isParsed()) {
            return report.run(console);
        }
        if (replay.isParsed()) {
            return replay.run(console, log);
        }
        throw UsageError(
            "no command given (recognize, report, replay, vad, endpoint, corpus, doctor, settings "
            "or "
            "log); "
            "see "
            "talvox --help");
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() == 0) {
            return app.exit(error, console.out, console.err);
        }
        return fail(console.err, error.what());
    } catch (const UsageError& error) {
        return fail(console.err, error.what());
    } catch (const std::bad_alloc&) {
        return fail(console.err, "out of memory");
    }
}

}  // namespace Cli
