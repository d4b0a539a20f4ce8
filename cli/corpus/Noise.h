#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "Dice.h"
#include "Waves.h"

namespace Cli {

/** The names of all kinds that a formula makes: white, pink, wind, hum, clicks, tones. */
const std::vector<std::string>& formulaNoises();

/**
 * Noise of a kind, at `WAVE_RATE_HZ` and with any loudness above 0. White; pink; wind in gusts,
 * below 300 Hz; hum of the mains at 50 Hz with overtones; clicks of a keyboard; tones, chords that
 * change twice a second.
 * @param kind one of `formulaNoises`
 */
Wave makeNoise(const std::string& kind, std::size_t samples, Dice dice);

}  // namespace Cli
