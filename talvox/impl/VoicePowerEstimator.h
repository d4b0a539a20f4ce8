/**
 * @file
 * Loudness of sound.
 */
#pragma once

#include "core/sound/SoundDataBuffer.h"

namespace Talvox {

/**
 * Turns buffers of 8-bit or 16-bit samples into a level in decibels. A plain value; used by one
 * thread at a time. Buffers may claim more samples than they hold: only those that are there are
 * read, while means are taken over the claimed number.
 */
class VoicePowerEstimator {
  public:
    /** Weight of a new buffer in the smoothed energy. */
    static constexpr float WEIGHT_NEW_ENERGY = 0.2F;
    /** Top of the level scale, for those who show levels. */
    static constexpr float POWER_MAX = 45.3087F;

    /** @param value 0: level above the learnt noise; 1: absolute level */
    void setMode(int value) { mode = value; }
    int getMode() const { return mode; }

    /** Sum of the squares of all samples; 0 for sample sizes other than 1 and 2, with a log line.
     */
    float getEnergy(const Sound::SoundDataBuffer& buffer) const;

    /**
     * Adds a buffer of noise. The noise level sets the energy of all noise so far against the
     * length of this one buffer, so equal buffers raise it.
     */
    void learnNoise(const Sound::SoundDataBuffer& buffer);

    /** Adds a buffer and follows its level. A buffer without samples makes the level NaN. */
    void updatePower(const Sound::SoundDataBuffer& buffer);

    /** Samples of noise seen so far, of all channels. */
    int getNoiseSamples() const { return noiseSamples; }
    float getNoiseEnergy() const { return noiseEnergy; }
    /** In decibels; 0 for silence. */
    float getNoiseLevel() const { return noiseLevel; }
    /** Smoothed mean energy of a sample. */
    float getPower() const { return power; }
    /** In decibels; 0 for silence. */
    float getLevel() const { return level; }

  private:
    int mode = 0;
    int noiseSamples = 0;
    float noiseEnergy = 0;
    float noiseLevel = 0;
    float power = 0;
    float level = 0;
};

}  // namespace Talvox
