#include "Verdict.h"

#include <algorithm>

namespace Cli {

Verdict compare(const Listening& listening, const std::vector<Label>& speech) {
    Verdict verdict;
    verdict.hasSpeech = !speech.empty();
    verdict.excessMs = listening.recordedMs;
    if (!verdict.hasSpeech) {
        verdict.isFalseBegin = listening.speechBeginsMs.has_value();
        return verdict;
    }
    const int64_t firstMs = speech.front().startMs;
    const int64_t lastMs = speech.back().endMs;
    const int64_t heardMs = std::min(listening.recordedMs, lastMs) - firstMs;
    verdict.excessMs -= std::max<int64_t>(0, heardMs);
    if (!listening.speechBeginsMs) {
        verdict.isMissed = true;
        return verdict;
    }
    if (*listening.speechBeginsMs < firstMs) {
        verdict.isFalseBegin = true;
    } else {
        verdict.beginLateMs = *listening.speechBeginsMs - firstMs;
    }
    if (listening.ending != Listening::SPEECH_ENDED) {
        verdict.isUnended = true;
    } else if (listening.recordedMs < lastMs) {
        verdict.isEarly = true;
    } else {
        verdict.endLateMs = listening.endsMs - lastMs;
    }
    return verdict;
}

std::vector<Verdict> scoreSound(const DetectorSetup& setup, const CorpusSound& sound) {
    if (!sound.speech.empty()) {
        return {compare(listen(setup, sound.samples, sound.rateHz), sound.speech)};
    }
    const std::size_t piece = static_cast<std::size_t>(sound.rateHz) * NOISE_PIECE_MS / 1000;
    std::vector<Verdict> verdicts;
    std::size_t begin = 0;
    do {
        verdicts.push_back(compare(listen(setup, sound.samples, sound.rateHz, begin), {}));
        begin += piece;
    } while (begin + piece <= sound.samples.size());
    return verdicts;
}

}  // namespace Cli
