#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace Gateway {

/**
 * Loudness of sound, frame by frame, and which frames are speech by their loudness alone.
 *
 * Frames are speech if they come within 25 dB of the loudest 200 ms, once those stand out from the
 * background. The background is the level that a tenth of the frames does not exceed. So steady
 * noise is never speech, however long it lasts, and a click is too short to set the peak.
 *
 * Not thread-safe.
 */
class FrameLevels {
  public:
    /** Distance between the beginnings of two frames: 10 ms. */
    static constexpr std::size_t STEP_SAMPLES = 160;

    /** Appends sound at 16 kHz. */
    void add(const int16_t* samples, std::size_t count);

    /** Frames, of 20 ms each, that are complete. */
    std::size_t getCount() const { return levelsDb.size(); }

    /**
     * Lowest level of a frame that is speech, in decibels above an amplitude of one.
     * @return a negative value, below every level, as long as no frame stands out
     */
    double findSpeechLevel() const;

    /** Level of a frame in decibels above an amplitude of one, 0 for digital silence. */
    double getLevel(std::size_t frame) const { return levelsDb[frame]; }

  private:
    std::vector<double> levelsDb;
    double stepEnergy = 0;
    double lastStepEnergy = -1;
    std::size_t stepSamples = 0;
};

}  // namespace Gateway
