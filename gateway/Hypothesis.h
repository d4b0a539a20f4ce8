#pragma once

#include <string>

namespace Gateway {

/** One text that may have been said. */
struct Hypothesis {
    std::string text;
    /** Geometric mean of the posterior probabilities of the words, 0 to 1. */
    double confidence = 0.0;
};

}  // namespace Gateway
