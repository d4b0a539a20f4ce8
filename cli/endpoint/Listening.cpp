#include "Listening.h"

#include "cli/SoundBuffers.h"
#include "talvox/VadAnalysis.h"

namespace Cli {

Listening listen(const DetectorSetup& setup, const std::vector<int16_t>& samples, int sampleRateHz,
                 std::size_t begin) {
    using Talvox::ListeningStep;
    Talvox::VadAnalyzer analyzer(setup.vad, sampleRateHz, setup.mode);
    const std::size_t length = bufferLength(sampleRateHz);
    Listening listening;
    for (std::size_t position = begin; position + length <= samples.size(); position += length) {
        const Talvox::VadBufferAnalysis analysis =
            analyzer.analyze(bufferAt(samples, position, length, sampleRateHz));
        listening.endsMs = analysis.arrivalMs;
        listening.recordedMs = analysis.endMs;
        if (analysis.step == ListeningStep::SPEECH_BEGINS) {
            listening.speechBeginsMs = analysis.arrivalMs;
        } else if (analysis.step == ListeningStep::NO_VOICE) {
            listening.ending = Listening::NO_VOICE;
            return listening;
        } else if (analysis.step == ListeningStep::LISTENING_ENDS) {
            const bool isOver = listening.speechBeginsMs && !analysis.isSpeech;
            listening.ending = isOver ? Listening::SPEECH_ENDED : Listening::LIMIT_REACHED;
            return listening;
        }
    }
    return listening;
}

}  // namespace Cli
