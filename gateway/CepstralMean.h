#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "gateway/SpeechModel.h"

// Named so by the recogniser's base library.
struct fe_s;

namespace Gateway {

/**
 * Mean of the cepstra of the speech in some sound. The recogniser subtracts such a mean from what
 * it hears; measured on the utterance's own beginning, it depends on nothing that was said before
 * and makes the streamed recognition as good as one over the finished utterance.
 */
class CepstralMean {
  public:
    /** Fewer frames say more about the words than about the channel. */
    static constexpr std::size_t MIN_FRAMES = 20;

    explicit CepstralMean(const SpeechModel& model);
    ~CepstralMean();
    CepstralMean(const CepstralMean&) = delete;
    CepstralMean& operator=(const CepstralMean&) = delete;

    /** Takes more of the sound in. */
    void add(const int16_t* samples, std::size_t count);

    /** Frames of speech, of 10 ms each, that have been found so far. */
    std::size_t getFrames() const { return frames; }

    /** The mean; empty where there is too little speech for one. */
    std::vector<float> get() const;

  private:
    fe_s* frontEnd = nullptr;
    std::vector<double> sums;
    std::size_t frames = 0;
};

}  // namespace Gateway
