#pragma once

#include <vector>

#include "CorpusFiles.h"

namespace Cli {

/**
 * Proposes where a recording holds speech, by the energy of frames of 10 ms: what is well above the
 * quietest tenth of the frames and at most 40 dB below the loudest. Gaps of up to 200 ms are
 * closed, and what lasts less than 80 ms is left out. A proposal only: in noise it misses faint
 * sounds, and it takes any loud one for speech.
 * @return none if no part of the sound stands out
 */
std::vector<Label> proposeLabels(const CorpusSound& sound);

}  // namespace Cli
