/**
 * @file
 * Format of a piece of sound.
 */
#pragma once

namespace Sound {

/** Five words that describe sound; a plain value. */
class SoundDataInfo {
  public:
    /** How samples are encoded; the numbers are fixed. */
    enum Codec { NONE = 0, SPEEX = 2 };

    /** Unknown format: no codec, everything else -1. */
    SoundDataInfo() = default;

    /**
     * @param sampleSizeInBytes bytes per sample of one channel; 2 means signed 16-bit
     *                          little-endian
     * @param samplesPerChannel -1 when not known
     */
    SoundDataInfo(Codec codecValue, int channels, int sampleRateHz, int sampleSizeInBytes,
                  int samplesPerChannel = -1)
        : codec(codecValue),
          channelCount(channels),
          sampleRate(sampleRateHz),
          sampleSize(sampleSizeInBytes),
          sampleCount(samplesPerChannel) {}

    /** As given to the constructor. */
    Codec getCodec() const { return codec; }
    int getChannelCount() const { return channelCount; }
    /** In Hz. */
    int getSampleRate() const { return sampleRate; }
    /** In bytes. */
    int getSampleSize() const { return sampleSize; }
    /** Per channel; -1 when not known. */
    int getSampleCount() const { return sampleCount; }
    void setSampleCount(int count) { sampleCount = count; }

  private:
    Codec codec = NONE;
    int channelCount = -1;
    int sampleRate = -1;
    int sampleSize = -1;
    int sampleCount = -1;
};

}  // namespace Sound
