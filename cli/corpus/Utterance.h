#pragma once

#include <cstdint>
#include <vector>

#include "Dice.h"
#include "Labels.h"
#include "Speaker.h"
#include "Waves.h"

namespace Cli {

/** Speech without noise and where it is. */
struct Utterance {
    Wave wave; /**< at `WAVE_RATE_HZ` */
    std::vector<Label> speech;
    std::string voice;
    int peak = 0; /**< the largest sample */
    int leadMs = 0;
};

/**
 * One utterance of the corpus: one to three parts of a sentence by one voice, with pauses between
 * them, after a lead and before a tail of silence. Everything but the tail follows from the seed
 * and the number.
 */
Utterance makeUtterance(uint64_t seed, int number, int tailMs, Speaker& speaker);

/** Six voices at the same time, without pause, for so many samples. */
Wave makeBabble(std::size_t samples, Dice dice, Speaker& speaker);

}  // namespace Cli
