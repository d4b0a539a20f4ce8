#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "gateway/AudioFormat.h"
#include "gateway/SpeexStreamDecoder.h"
#include "tools/Resampler.h"

namespace Gateway {

/**
 * Turns the bytes of a client's sound, as they arrive, into samples of the decoder's rate. Sound
 * that begins as an Ogg stream is Speex, also where its content type says PCM: clients that choose
 * the encoding by the connection announce the format that they were set to.
 */
class SoundDecoder {
  public:
    SoundDecoder(const AudioFormat& soundFormat, unsigned outputRateHz);
    ~SoundDecoder();
    SoundDecoder(const SoundDecoder&) = delete;
    SoundDecoder& operator=(const SoundDecoder&) = delete;

    /**
     * Appends to `output` what the bytes give.
     * @return an empty text, or the reason why the sound cannot be decoded
     */
    std::string write(const char* data, std::size_t size, std::vector<int16_t>& output);

    /** Tells that the sound is over, and appends what is left. @return as `write` */
    std::string finish(std::vector<int16_t>& output);

    /** Samples per second of the sound as it was sent; 0 while that is not known. */
    unsigned getInputRateHz() const;

    /** What was wrong with the sound without making it useless; empty where nothing was. */
    std::string getRemark() const;

  private:
    std::string decode(const char* data, std::size_t size, std::vector<int16_t>& output);
    void readPcm(const char* data, std::size_t size, std::vector<int16_t>& samples);

    const AudioFormat format;
    const unsigned outputRate;
    std::unique_ptr<SpeexStreamDecoder> speex;
    std::unique_ptr<Tools::Resampler> resampler;
    bool hasBytes = false;
    /** The first bytes, until they tell whether the sound is an Ogg stream. */
    std::string beginning;
    bool beginningKnown = false;
    /** First byte of a sample that two calls share, -1 when there is none. */
    int pending = -1;
};

}  // namespace Gateway
