#pragma once

#include <speex/speex.h>

#include <cstdint>
#include <vector>

namespace Sound {

/** One Speex encoder of libspeex: frames in, packets out. */
class SpeexCoder {
  public:
    /** @param sampleRateHz above 0; chooses the band. @param quality 0 to 10 */
    SpeexCoder(int sampleRateHz, int quality);
    ~SpeexCoder();
    SpeexCoder(const SpeexCoder&) = delete;
    SpeexCoder& operator=(const SpeexCoder&) = delete;

    /** False when the library had no memory for an encoder; nothing else may be called then. */
    bool isReady() const { return state != nullptr; }

    /** Samples per frame. */
    int getFrameSize() const { return frameSize; }

    /** Samples by which a packet's sound lags behind the encoder's input. */
    int getLookAhead() const { return lookAhead; }

    /** Samples by which a decoder's output lags behind the packet's sound. */
    int getDecoderLag() const { return decoderLag; }

    /** The packet that begins a Speex stream. */
    std::vector<unsigned char> makeHeader() const;

    /**
     * Encodes `getFrameSize()` samples into one packet, which is valid until the next call; the
     * samples may be changed.
     */
    const std::vector<unsigned char>& encodeFrame(int16_t* samples);

  private:
    const int sampleRate;
    const SpeexMode* const mode;
    void* const state;
    SpeexBits bits;
    std::vector<unsigned char> packet;
    int frameSize = 0;
    int lookAhead = 0;
    int decoderLag = 0;
};

}  // namespace Sound
