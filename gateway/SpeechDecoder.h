#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "gateway/Hypothesis.h"
#include "gateway/SpeechModel.h"

// The name is PocketSphinx's.
struct ps_decoder_s;

namespace Gateway {

/**
 * One decoder with its model in memory, for one utterance after the other; not thread-safe.
 *
 * Whatever an utterance leaves behind (noise floor, cepstral mean) is put back before the next,
 * so that the same samples, cut in the same way, always give the same answer.
 */
class SpeechDecoder {
  public:
    /** Distinct texts in an answer at most. */
    static constexpr std::size_t MAX_HYPOTHESES = 5;

    /** Loads the model, which takes a quarter of a second. @return null when that fails */
    static std::unique_ptr<SpeechDecoder> create(const SpeechModel& model);

    ~SpeechDecoder();
    SpeechDecoder(const SpeechDecoder&) = delete;
    SpeechDecoder& operator=(const SpeechDecoder&) = delete;

    /**
     * Begins an utterance.
     * @param cepstralMean the mean of its cepstra as far as it is known, else empty
     * @return false when the decoder failed
     */
    bool begin(const std::vector<float>& cepstralMean);

    /** Decodes more of the utterance. @return false when the decoder failed */
    bool decode(const int16_t* samples, std::size_t count);

    /** Ends the utterance. @return what was said, best first; empty when nothing was understood */
    std::vector<Hypothesis> finish();

    /** Ends the utterance without an answer; does nothing where none has begun. */
    void abandon();

  private:
    explicit SpeechDecoder(ps_decoder_s* loaded);

    ps_decoder_s* const decoder;
    std::vector<float> initialMean;
    bool inUtterance = false;
};

}  // namespace Gateway
