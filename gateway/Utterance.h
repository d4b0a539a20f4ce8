#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "gateway/CepstralMean.h"
#include "gateway/DecoderPool.h"

namespace Gateway {

/**
 * Recognises one utterance while it is still arriving.
 *
 * The sound goes to the recogniser in pieces of fixed length, however it arrives, so that the
 * answer depends on the sound alone. Its first one and a half seconds of speech are held back to
 * measure their cepstral mean, then decoded, and the rest follows as it comes; all that is left
 * after the last sample is the recogniser's second pass. While all decoders are busy the sound is
 * kept, for as long as it arrives, and decoded as soon as one is free.
 */
class Utterance {
  public:
    /** Samples that are decoded at once: 100 ms. */
    static constexpr std::size_t PIECE_SAMPLES = SpeechModel::RATE_HZ / 10;
    /** Frames of speech, of 10 ms, over which the cepstral mean is measured. */
    static constexpr std::size_t MEAN_FRAMES = 150;
    /** Longest utterance in seconds; the recogniser holds 150 s at most. */
    static constexpr std::size_t MAX_SECONDS = 120;
    static constexpr std::size_t MAX_SAMPLES = MAX_SECONDS * SpeechModel::RATE_HZ;

    enum class Status { DONE, BUSY, FAILED };

    /** @param decoderPool must outlive the utterance */
    explicit Utterance(DecoderPool& decoderPool);

    /** Takes more sound, at the recogniser's rate. @return false once the utterance is too long */
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

    /** Time that the recogniser has taken so far, in milliseconds. */
    uint64_t getDecodeMs() const { return static_cast<uint64_t>(decodeNs / 1000000); }

  private:
    void measure(bool last);
    bool beginDecoding(DecoderPool::Lease lease);
    void decode(bool last);

    DecoderPool& pool;
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
