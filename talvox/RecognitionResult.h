/**
 * @file
 * One hypothesis.
 */
#pragma once

#include <string>
#include <utility>
#include <vector>

namespace Talvox {

/** What may have been said, and how sure the recognizer is; a plain value. */
class RecognitionResult {
  public:
    /** Stands for "no confidence known". */
    static constexpr float UNKNOWN_CONFIDENCE = -1.0F;

    /** A text in UTF-8, and a confidence from 0 to 1 or `UNKNOWN_CONFIDENCE`. */
    RecognitionResult(std::string utterance, float confidenceValue)
        : text(std::move(utterance)), confidence(confidenceValue) {}

    /** UTF-8. */
    const std::string& getText() const { return text; }
    /** 0 to 1, or `UNKNOWN_CONFIDENCE`. */
    float getConfidence() const { return confidence; }

  private:
    std::string text;
    float confidence;
};

/** Hypotheses, the best one first. */
using RecognitionResults = std::vector<RecognitionResult>;

}  // namespace Talvox
