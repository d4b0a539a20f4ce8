#include "VadCommand.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

#include "AudioFile.h"
#include "ExitStatus.h"
#include "HumanVad.h"
#include "JsonVad.h"
#include "SoundBuffers.h"
#include "SoundInput.h"
#include "VadWarnings.h"
#include "core/sound/Recorder.h"
#include "talvox/SpeechError.h"
#include "talvox/VadAnalysis.h"

namespace Cli {

namespace {

Sound::Recorder::Mode sessionMode(const Talvox::Settings& settings) {
    return settings.getString(Talvox::Settings::SKS_SESSION_MODE) ==
                   Talvox::Settings::SESSION_MODE_GENERAL
               ? Sound::Recorder::MODE_GENERAL
               : Sound::Recorder::MODE_VOICE_RECOGNITION;
}

/** What a session reports by the step; nothing when it goes on listening. */
std::optional<SessionEvent> toSessionEvent(const Talvox::VadBufferAnalysis& buffer) {
    SessionEvent event;
    event.ms = buffer.arrivalMs;
    switch (buffer.step) {
        case Talvox::ListeningStep::GO_ON:
            return std::nullopt;
        case Talvox::ListeningStep::RECORDING_BEGINS:
            event.kind = SessionEvent::RECORDING_BEGIN;
            break;
        case Talvox::ListeningStep::SPEECH_BEGINS:
            event.kind = SessionEvent::SPEAKING_BEGIN;
            break;
        case Talvox::ListeningStep::LISTENING_ENDS:
            event.kind = SessionEvent::RECORDING_DONE;
            break;
        case Talvox::ListeningStep::NO_VOICE:
            event.kind = SessionEvent::FAILURE;
            event.errorCode = Talvox::SpeechError::ErrorNoVoice;
            break;
    }
    return event;
}

bool endsListening(Talvox::ListeningStep step) {
    return step == Talvox::ListeningStep::LISTENING_ENDS || step == Talvox::ListeningStep::NO_VOICE;
}

std::unique_ptr<VadPrinter> makePrinter(bool json, Sound::Recorder::Mode mode, std::ostream& out) {
    if (json) {
        return std::make_unique<JsonVad>(out);
    }
    return std::make_unique<HumanVad>(out, mode == Sound::Recorder::MODE_GENERAL);
}

}  // namespace

int runVad(const VadOptions& options, Console& console, LogOutput& log) {
    log.show(true);
    const boost::shared_ptr<Talvox::Settings> settings = buildSettings(options.settings);
    const int rate = settings->getSampleRate();
    checkSampleRate(rate);
    warnOfVadMistakes(*settings, console.err);
    std::vector<int16_t> samples = loadSound(options.file, console.in, rate, MAX_CLIP_SECONDS);
    addLeadIn(samples, rate, options.leadInMs);
    const std::size_t length = bufferLength(rate);

    const Sound::Recorder::Mode mode = sessionMode(*settings);
    const std::unique_ptr<VadPrinter> printer = makePrinter(options.json, mode, console.out);
    Talvox::VadAnalyzer analyzer(settings->getString(Talvox::Settings::SKS_VAD_SETTINGS), rate,
                                 mode);
    bool isSpeech = false;
    bool isListening = true;
    // A session goes on behind the sound, in silence, until one of its limits ends it.
    for (std::size_t position = 0; options.asSession ? isListening : position < samples.size();
         position += length) {
        const Talvox::VadBufferAnalysis analysis =
            analyzer.analyze(bufferAt(samples, position, length, rate));
        printer->printBuffer(analysis);
        const std::optional<SessionEvent> event = toSessionEvent(analysis);
        if (options.asSession && event) {
            printer->printSessionEvent(*event);
        }
        isSpeech = analysis.isSpeech;
        isListening = !endsListening(analysis.step);
    }
    printer->printSegments(analyzer.segments(), isSpeech);
    return EXIT_OK;
}

}  // namespace Cli
