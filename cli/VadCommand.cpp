#include "VadCommand.h"

#include <cstdint>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include "AudioFile.h"
#include "ExitStatus.h"
#include "HumanVad.h"
#include "Interrupts.h"
#include "JsonVad.h"
#include "LiveVad.h"
#include "Microphone.h"
#include "SoundBuffers.h"
#include "SoundDecoder.h"
#include "SoundInput.h"
#include "UsageError.h"
#include "VadRun.h"
#include "VadWarnings.h"
#include "cli/endpoint/VadText.h"
#include "cli/report/VadReport.h"
#include "core/sound/Recorder.h"
#include "talvox/VadAnalysis.h"

namespace Cli {

namespace {

Sound::Recorder::Mode sessionMode(const Talvox::Settings& settings) {
    return settings.getString(Talvox::Settings::SKS_SESSION_MODE) ==
                   Talvox::Settings::SESSION_MODE_GENERAL
               ? Sound::Recorder::MODE_GENERAL
               : Sound::Recorder::MODE_VOICE_RECOGNITION;
}

std::unique_ptr<VadPrinter> makePrinter(const VadOptions& options, const std::string& vad,
                                        Sound::Recorder::Mode mode, const Console& console) {
    if (options.json) {
        return std::make_unique<JsonVad>(console.out);
    }
    if (options.microphone && console.outIsTerminal) {
        return std::make_unique<LiveVad>(console.out,
                                         LiveThresholds{parameterNumber(vad, "activityon"),
                                                        parameterNumber(vad, "activityoff")});
    }
    return std::make_unique<HumanVad>(console.out, mode == Sound::Recorder::MODE_GENERAL);
}

/** Runs the detector over the sound. */
void analyzeSound(const std::vector<int16_t>& samples, int rateHz, bool asSession,
                  Talvox::VadAnalyzer& analyzer, VadRun& run) {
    const std::size_t length = bufferLength(rateHz);
    // A session goes on behind the sound, in silence, until one of its limits ends it.
    for (std::size_t position = 0; asSession ? run.isListening() : position < samples.size();
         position += length) {
        run.show(analyzer.analyze(bufferAt(samples, position, length, rateHz)));
    }
}

/**
 * Runs the detector over what the microphone records, until Ctrl-C, the end of a session or the
 * failure of the device.
 * @return what was recorded
 */
std::vector<int16_t> analyzeMicrophone(int rateHz, bool asSession, Sound::Recorder::Mode mode,
                                       Talvox::VadAnalyzer& analyzer, VadRun& run,
                                       std::ostream& out) {
    std::vector<int16_t> samples;
    Microphone microphone(rateHz, mode);
    const Interrupts interrupts([&microphone] { microphone.interrupt(); });
    const std::size_t most = samplesIn(MAX_CLIP_SECONDS, rateHz);
    while (samples.size() < most && (!asSession || run.isListening())) {
        const boost::shared_ptr<const Sound::SoundDataBuffer> buffer = microphone.take();
        if (buffer == nullptr) {
            break;
        }
        run.show(analyzer.analyze(*buffer));
        out.flush();
        appendSamples(samples, *buffer);
    }
    if (samples.empty() && microphone.hasFailed()) {
        throw UsageError("cannot record; is there a microphone, and a sound server for it?");
    }
    return samples;
}

}  // namespace

int runVad(const VadOptions& options, Console& console, LogOutput& log) {
    log.show(true);
    const boost::shared_ptr<Talvox::Settings> settings = buildSettings(options.settings);
    const int rate = settings->getSampleRate();
    checkSampleRate(rate);
    warnOfVadMistakes(*settings, console.err);
    std::vector<int16_t> samples;
    if (!options.microphone) {
        samples = loadSound(options.file, console.in, rate, MAX_CLIP_SECONDS);
        addLeadIn(samples, rate, options.leadInMs);
    }
    const std::string vad = settings->getString(Talvox::Settings::SKS_VAD_SETTINGS);
    const Sound::Recorder::Mode mode = sessionMode(*settings);
    const std::unique_ptr<VadPrinter> printer = makePrinter(options, vad, mode, console);
    Talvox::VadAnalyzer analyzer(vad, rate, mode);
    VadReport report;
    VadRun run(*printer, options.asSession || options.microphone,
               options.report.empty() ? nullptr : &report);
    if (options.microphone) {
        samples = analyzeMicrophone(rate, options.asSession, mode, analyzer, run, console.out);
    } else {
        analyzeSound(samples, rate, options.asSession, analyzer, run);
    }
    run.finish(analyzer.segments());
    if (!options.report.empty()) {
        const std::string name = options.microphone ? "microphone" : options.file;
        report.write(options.report, {name, vad, rate, &samples});
    }
    return EXIT_OK;
}

}  // namespace Cli
