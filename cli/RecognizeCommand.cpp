#include "RecognizeCommand.h"

#include <boost/make_shared.hpp>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <memory>
#include <optional>
#include <random>

#include "Address.h"
#include "CertificateFile.h"
#include "Dump.h"
#include "ExitStatus.h"
#include "HumanEvents.h"
#include "Interrupts.h"
#include "JsonEvents.h"
#include "PrinterList.h"
#include "Session.h"
#include "SoundInput.h"
#include "Text.h"
#include "UsageError.h"
#include "VadWarnings.h"
#include "core/sound/FileRecorder.h"
#include "core/sound/Recorder.h"
#include "talvox/SessionRecording.h"
#include "talvox/Settings.h"
#include "talvox/SpeechError.h"

namespace Cli {

namespace {

const char* const URL_DFLT = "http://127.0.0.1:8090";
const char* const LANGUAGE_DFLT = "en-US";
const int UUID_LENGTH = 32;
// A session takes 20 s of sound; standard input may be a pipe that never ends.
const int STANDARD_INPUT_MAX_SECONDS = 60;

/** Makes the engine hear the file in place of a device. */
void installPlayer(const RecognizeOptions& options, int sampleRateHz, std::istream& input) {
    std::vector<int16_t> samples =
        loadSound(options.file, input, sampleRateHz, STANDARD_INPUT_MAX_SECONDS);
    addLeadIn(samples, sampleRateHz, options.leadInMs);
    Sound::Recorder::setFactory(
        [samples] { return boost::make_shared<Sound::FileRecorder>(samples); });
}

/** Whether nothing listens at the address; libcurl's words are all that says so. */
bool isRefused(const SessionEvent& failure) {
    return failure.reason.find("connect to server") != std::string::npos;
}

/** What a user can do about an error; empty where name and reason say it all. */
std::string hint(const SessionEvent& failure, const RecognizeOptions& options,
                 const Talvox::Settings& settings) {
    switch (failure.errorCode) {
        case Talvox::SpeechError::ErrorNetwork:
            return isRefused(failure) ? "is a gateway running at " + settings.getUrl() + "?" : "";
        case Talvox::SpeechError::ErrorAudio:
            return options.microphone ? "is there a microphone, and a sound server for it?" : "";
        case Talvox::SpeechError::ErrorNoVoice:
            return "\"talvox vad\" shows what the detector decides";
        case Talvox::SpeechError::ErrorNotAvailable:
            return "see the settings \"asr\" and \"asrpolicy\"";
        default:
            return "";
    }
}

void addPrinters(const RecognizeOptions& options, Console& console, std::ofstream& eventsFile,
                 PrinterList& printers) {
    if (options.json) {
        printers.add(std::make_unique<JsonEvents>(console.out));
    } else {
        printers.add(std::make_unique<HumanEvents>(console.out, console.outIsTerminal));
    }
    if (!options.eventsFile.empty()) {
        eventsFile.open(options.eventsFile);
        if (!eventsFile) {
            throw UsageError("cannot write to " + options.eventsFile + ": " + std::strerror(errno));
        }
        printers.add(std::make_unique<JsonEvents>(eventsFile));
    }
}

/** Records the session as long as it lives; what is recorded is on the disk afterwards. */
class Recording {
  public:
    explicit Recording(const RecognizeOptions& options) {
        Talvox::SessionRecordingOptions recording;
        recording.folder = options.recordDirectory;
        recording.hasSound = !options.noSound;
        recording.source = options.microphone ? "microphone" : options.file;
        if (!Talvox::SessionRecording::start(recording)) {
            throw UsageError("cannot record in " + options.recordDirectory);
        }
    }
    ~Recording() { Talvox::SessionRecording::stop(); }
    Recording(const Recording&) = delete;
    Recording& operator=(const Recording&) = delete;
};

void reportError(const SessionEvent& failure, const RecognizeOptions& options,
                 const Talvox::Settings& settings, std::ostream& err) {
    err << "talvox: recognition ended with " << errorText(failure);
    const std::string advice = hint(failure, options, settings);
    if (!advice.empty()) {
        err << " (" << printable(advice) << ')';
    }
    err << std::endl;
}

}  // namespace

std::string makeUuid() {
    static const char DIGITS[] = "0123456789abcdef";
    std::random_device random;
    std::uniform_int_distribution<int> digit(0, 15);
    std::string uuid;
    for (int index = 0; index < UUID_LENGTH; ++index) {
        uuid += DIGITS[digit(random)];
    }
    return uuid;
}

std::vector<SettingsOptions::Assignment> recognizeDefaults() {
    return {{Talvox::Settings::SKS_URL, URL_DFLT},
            {Talvox::Settings::SKS_UUID, makeUuid()},
            {Talvox::Settings::RS_LANGUAGE, LANGUAGE_DFLT}};
}

int runRecognize(const RecognizeOptions& options, Console& console, LogOutput& log) {
    // The user gets the warnings about the settings and the sound in any case.
    log.show(true);
    const boost::shared_ptr<Talvox::Settings> settings = buildSettings(options.settings);
    checkRequestSettings(*settings);
    checkSampleRate(settings->getSampleRate());
    warnOfVadMistakes(*settings, console.err);
    if (!options.certificateFile.empty()) {
        trustAuthoritiesOf(options.certificateFile);
    }
    std::optional<Dump> dump;
    if (!options.dumpDirectory.empty()) {
        dump.emplace(options.dumpDirectory);
    }
    if (!options.microphone) {
        installPlayer(options, settings->getSampleRate(), console.in);
    }
    std::optional<Recording> recording;
    if (!options.recordDirectory.empty()) {
        recording.emplace(options);
    }
    log.show(settings->getInt(Talvox::Settings::SKS_VERBOSE_LEVEL) > 0);

    std::ofstream eventsFile;
    PrinterList printers;
    addPrinters(options, console, eventsFile, printers);
    Session session(settings);
    const Interrupts interrupts([&session] { session.interrupt(); });
    if (dump) {
        dump->begin(log);
    }
    const SessionEvent last = session.run(printers);
    recording.reset();
    int status = EXIT_OK;
    if (last.kind == SessionEvent::FAILURE) {
        reportError(last, options, *settings, console.err);
        status = EXIT_ENDED_IN_ERROR;
    }
    if (!eventsFile) {
        console.err << "talvox: cannot write to " << printable(options.eventsFile) << std::endl;
        status = EXIT_ENDED_IN_ERROR;
    }
    if (dump && !dump->isComplete(log)) {
        console.err << "talvox: the dump " << printable(dump->getPath()) << " is not complete"
                    << std::endl;
        status = EXIT_ENDED_IN_ERROR;
    }
    return status;
}

}  // namespace Cli
