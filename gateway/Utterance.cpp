#include "gateway/Utterance.h"

#include <algorithm>

#include "pal/kd_time.h"

namespace Gateway {

Utterance::Utterance(DecoderPool& decoderPool, Arrival soundArrival)
    : pool(decoderPool), arrival(soundArrival), mean(pool.getModel()) {}

bool Utterance::add(const std::vector<int16_t>& samples) {
    if (total + samples.size() > MAX_SAMPLES) {
        return false;
    }
    total += samples.size();
    sound.insert(sound.end(), samples.begin(), samples.end());
    measure(false);
    if (!measuring && !decoder && !failed) {
        DecoderPool::Lease lease = pool.tryAcquire();
        if (lease) {
            failed = !beginDecoding(std::move(lease));
        }
    }
    decode(false);
    return true;
}

Utterance::Status Utterance::finish(std::vector<Hypothesis>& hypotheses) {
    hypotheses.clear();
    measure(true);
    if (mean.isSilent()) {
        return Status::DONE;
    }
    if (!decoder && !failed) {
        DecoderPool::Lease lease = pool.acquire();
        if (!lease) {
            return Status::BUSY;
        }
        failed = !beginDecoding(std::move(lease));
    }
    decode(true);
    if (failed) {
        return Status::FAILED;
    }
    const KDust begin = kdGetTimeUST();
    hypotheses = decoder->finish();
    decodeNs += kdGetTimeUST() - begin;
    decoder.reset();
    return Status::DONE;
}

void Utterance::measure(bool last) {
    while (measuring && measured < sound.size()) {
        const std::size_t count = std::min(PIECE_SAMPLES, sound.size() - measured);
        if (count < PIECE_SAMPLES && !last) {
            return;
        }
        mean.add(&sound[measured], count);
        measured += count;
        measuring = arrival == Arrival::WHOLE || mean.countSpeech() < MEAN_FRAMES;
    }
}

bool Utterance::beginDecoding(DecoderPool::Lease lease) {
    decoder = std::move(lease);
    skipWait();
    return decoder->begin(mean.get());
}

void Utterance::skipWait() {
    const std::size_t leading = mean.countLeadingSamples();
    if (leading > LEAD_SAMPLES) {
        sound.erase(sound.begin(),
                    sound.begin() + static_cast<std::ptrdiff_t>(leading - LEAD_SAMPLES));
    }
}

void Utterance::decode(bool last) {
    if (!decoder) {
        return;
    }
    const KDust begin = kdGetTimeUST();
    std::size_t decoded = 0;
    while (!failed && decoded < sound.size()) {
        const std::size_t count = std::min(PIECE_SAMPLES, sound.size() - decoded);
        if (count < PIECE_SAMPLES && !last) {
            break;
        }
        failed = pool.isClosed() || !decoder->decode(&sound[decoded], count);
        decoded += count;
    }
    sound.erase(sound.begin(), sound.begin() + static_cast<std::ptrdiff_t>(decoded));
    decodeNs += kdGetTimeUST() - begin;
}

}  // namespace Gateway
