#pragma once

#include <cstddef>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "gateway/Hypothesis.h"

// The names are PocketSphinx's.
struct ps_decoder_s;
struct ps_seg_s;

namespace Gateway {

/** Reads the hypotheses of an utterance that has just ended out of the decoder. */
class HypothesisReader {
  public:
    explicit HypothesisReader(ps_decoder_s* endedDecoder);

    /** The best text first, then different ones; empty when nothing was understood. */
    std::vector<Hypothesis> read(std::size_t maxCount);

  private:
    double bestConfidence() const;
    void addAlternatives(std::size_t maxCount, std::vector<Hypothesis>& hypotheses);
    void readWordPosteriors();
    double alternativeConfidence(ps_seg_s* segment) const;

    ps_decoder_s* const decoder;
    /** Best logarithmic posterior of each word by the frame in which it begins. */
    std::map<std::pair<int, std::string>, double> wordPosteriors;
};

}  // namespace Gateway
