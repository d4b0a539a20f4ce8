/**
 * @file
 * Ogg Speex encoder.
 */
#pragma once

#include <boost/scoped_ptr.hpp>

#include "core/sound/Encoder.h"

namespace Sound {

/**
 * Encodes 16-bit mono sound as Speex in Ogg: the band follows from the sample rate. The
 * stream decodes to exactly as many samples as went in.
 */
class KORVEL_CORE_API OggSpeexEncoder : public Encoder {
  public:
    /** Page fill in bytes where nothing else is asked for. */
    static const int PAGE_FILL_BYTES_DFLT = 4096;

    /**
     * @param info          1 channel, 2 bytes a sample; the rate chooses the mode: below 12500 Hz
     *                      narrow band, below 25000 Hz wide band, else ultra-wide band. Sound of
     *                      another format is an encoding that yields no output; a line is logged.
     * @param quality       0 to 10; values outside are taken to the nearer end
     * @param pageFillBytes a page is closed once it holds this many bytes (and at least four
     *                      packets)
     */
    OggSpeexEncoder(const SoundDataInfo& info, int quality,
                    int pageFillBytes = PAGE_FILL_BYTES_DFLT);
    ~OggSpeexEncoder() override;

    void encode(const SoundDataBuffer& buffer) override;
    boost::shared_ptr<SoundDataBuffer> takeOutput(int maxBytes) override;
    void finish() override;

  private:
    class Impl;
    boost::scoped_ptr<Impl> impl;
};

}  // namespace Sound
