#include "talvox/impl/ListeningRules.h"

#include "core/util/Time.h"

namespace Talvox {

namespace {

using Util::NS_PER_MS;
const int64_t NO_VOICE_LIMIT_NS = 5000 * NS_PER_MS;
const unsigned SOUND_LIMIT_MS = 20000;

}  // namespace

unsigned ListeningRules::getDurationMs(const Sound::SoundDataBuffer& buffer) {
    const int sampleRate = buffer.getInfo().getSampleRate();
    const int64_t samples = buffer.getSampleCount();
    return sampleRate > 0 && samples > 0 ? static_cast<unsigned>(samples * 1000 / sampleRate) : 0;
}

bool ListeningRules::isNoiseLearned(int64_t sinceStartNs, unsigned leadingNoiseMs) {
    return sinceStartNs / NS_PER_MS > static_cast<int64_t>(leadingNoiseMs);
}

ListeningStep ListeningRules::decide(bool wasSpeech, bool isSpeech, unsigned recordedMs,
                                     int64_t sinceStartNs) {
    if ((wasSpeech && !isSpeech) || recordedMs > SOUND_LIMIT_MS) {
        return ListeningStep::LISTENING_ENDS;
    }
    if (!isSpeech) {
        return sinceStartNs >= NO_VOICE_LIMIT_NS ? ListeningStep::NO_VOICE : ListeningStep::GO_ON;
    }
    return wasSpeech ? ListeningStep::GO_ON : ListeningStep::SPEECH_BEGINS;
}

}  // namespace Talvox
