#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "core/util/Time.h"
#include "gateway/CepstralMean.h"
#include "gateway/DecoderPool.h"

namespace Gateway {

/**
 * Recognises one utterance.
 *
 * The decoder needs the cepstral mean of the speech before it can begin. A whole utterance is
 * collected and decoded with its own mean when it is complete. A streamed one is decoded while it
 * arrives: its first one and a half seconds of speech, and the silence or noise before them, are
 * held back to measure the mean, then decoded, and the rest follows as it comes. Speech that is
 * shorter than that is decoded like a whole utterance. What is left after the last sample of a
 * longer one is the decoder's second pass.
 *
 * The decoder does not hear the wait before the speech, apart from its last `LEAD_SAMPLES`: words
 * should not depend on how long a speaker hesitates.
 *
 * The sound goes to the decoder in pieces of fixed length, however it arrives, so that the answer
 * depends on the sound and the arrival only. While all decoders are busy the sound is
 * kept, for as long as it arrives, and decoded as soon as one is free.
 */
class Utterance {
  public:
    /** Samples that are decoded at once: 100 ms. */
    static constexpr std::size_t PIECE_SAMPLES = SpeechModel::RATE_HZ / 10;
    /** Frames of speech, of 10 ms, over which the cepstral mean is measured. */
    static constexpr std::size_t MEAN_FRAMES = 150;
    /** Sound before the first frame of speech that is decoded: 300 ms, for quiet first sounds. */
    static constexpr std::size_t LEAD_SAMPLES = 3 * PIECE_SAMPLES;
    /** Longest utterance in seconds; the decoder holds 150 s at most. */
    static constexpr std::size_t MAX_SECONDS = 120;
    static constexpr std::size_t MAX_SAMPLES = MAX_SECONDS * SpeechModel::RATE_HZ;

    enum class Arrival { WHOLE, STREAMED };
    enum class Status { DONE, BUSY, FAILED };

    /**
     * @param decoderPool   must outlive the utterance
     * @param soundArrival  STREAMED if the speaker may still speak while sound arrives
     */
    Utterance(DecoderPool& decoderPool, Arrival soundArrival);

    /** Takes more sound, at the decoder's rate. @return false once the utterance is too long */
    bool add(const std::vector<int16_t>& samples);

    /**
     * Ends the utterance. Blocks while it decodes and, before that, while all decoders are busy:
     * as long as `DecoderPool::acquire` waits. Called once.
     * @param[out] hypotheses best first; empty where nothing was understood
     * @return BUSY when no decoder became free in time
     */
    Status finish(std::vector<Hypothesis>& hypotheses);

    /** Length of the sound so far, in milliseconds. */
    uint64_t getDurationMs() const { return total * 1000 / SpeechModel::RATE_HZ; }

    /** Time that the decoder has taken so far, in milliseconds. */
    uint64_t getDecodeMs() const { return static_cast<uint64_t>(decodeNs / Util::NS_PER_MS); }

  private:
    void measure(bool last);
    void skipWait();
    bool beginDecoding(DecoderPool::Lease lease);
    void decode(bool last);

    DecoderPool& pool;
    const Arrival arrival;
    CepstralMean mean;
    DecoderPool::Lease decoder;
    std::vector<int16_t> sound;
    /** Samples of `sound` that the mean has seen. */
    std::size_t measured = 0;
    uint64_t total = 0;
    int64_t decodeNs = 0;
    bool measuring = true;
    bool failed = false;
};

}  // namespace Gateway
