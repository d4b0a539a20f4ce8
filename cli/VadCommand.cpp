#include "VadCommand.h"

#include <algorithm>
#include <cstdint>
#include <memory>
#include <vector>

#include "AudioFile.h"
#include "ExitStatus.h"
#include "HumanVad.h"
#include "JsonVad.h"
#include "SoundInput.h"
#include "core/sound/Recorder.h"
#include "core/sound/SoundDataBuffer.h"
#include "talvox/VadAnalysis.h"

namespace Cli {

namespace {

// As a session asks of its recorder.
const int BUFFER_MS = 100;
const int SAMPLE_SIZE = 2;

/** The buffer that begins at sample `position`; behind the end of the sound it is silent. */
Sound::SoundDataBuffer bufferAt(const std::vector<int16_t>& samples, std::size_t position,
                                std::size_t length, int sampleRateHz) {
    std::vector<unsigned char> bytes(length * SAMPLE_SIZE);
    const std::size_t end = std::min(samples.size(), position + length);
    for (std::size_t index = position; index < end; ++index) {
        const auto value = static_cast<uint16_t>(samples[index]);
        bytes[(index - position) * SAMPLE_SIZE] = static_cast<unsigned char>(value & 0xFFU);
        bytes[(index - position) * SAMPLE_SIZE + 1] = static_cast<unsigned char>(value >> 8U);
    }
    return Sound::SoundDataBuffer(Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 1, sampleRateHz,
                                                       SAMPLE_SIZE, static_cast<int>(length)),
                                  std::move(bytes));
}

Sound::Recorder::Mode sessionMode(const Talvox::Settings& settings) {
    return settings.getString(Talvox::Settings::SKS_SESSION_MODE) ==
                   Talvox::Settings::SESSION_MODE_GENERAL
               ? Sound::Recorder::MODE_GENERAL
               : Sound::Recorder::MODE_VOICE_RECOGNITION;
}

std::unique_ptr<VadPrinter> makePrinter(bool json, std::ostream& out) {
    if (json) {
        return std::make_unique<JsonVad>(out);
    }
    return std::make_unique<HumanVad>(out);
}

}  // namespace

int runVad(const VadOptions& options, Console& console, LogOutput& log) {
    log.show(true);
    const boost::shared_ptr<Talvox::Settings> settings = buildSettings(options.settings);
    const int rate = settings->getSampleRate();
    const std::vector<int16_t> samples =
        loadSound(options.file, console.in, rate, MAX_CLIP_SECONDS);
    const std::size_t length = static_cast<std::size_t>(rate) * BUFFER_MS / 1000;

    const std::unique_ptr<VadPrinter> printer = makePrinter(options.json, console.out);
    Talvox::VadAnalyzer analyzer(settings->getString(Talvox::Settings::SKS_VAD_SETTINGS), rate,
                                 sessionMode(*settings));
    bool isSpeech = false;
    for (std::size_t position = 0; position < samples.size(); position += length) {
        const Talvox::VadBufferAnalysis analysis =
            analyzer.analyze(bufferAt(samples, position, length, rate));
        printer->printBuffer(analysis);
        isSpeech = analysis.isSpeech;
    }
    printer->printSegments(analyzer.segments(), isSpeech);
    return EXIT_OK;
}

}  // namespace Cli
