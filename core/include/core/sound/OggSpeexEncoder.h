/**
 * @file
 * Ogg Speex encoder.
 */
#pragma once

#include <boost/scoped_ptr.hpp>

#include "core/sound/Encoder.h"

namespace Sound {

/**
 * Encodes 16-bit mono sound as Speex in Ogg: the band follows from the sample rate. The stream says
 * through its granule positions that it holds exactly as many samples as went in, and `speexdec`
 * returns that many; only where there is less sound than one frame without its look-ahead (15 ms
 * at 8000 Hz) does that tool add the codec's delay.
 *
 * A buffer is taken at its bytes, whatever sample count it claims. A buffer of another format than
 * that given to the constructor, and every buffer after `finish`, is ignored with a log line.
 * `takeOutput` returns null until the first frame is full or the stream is finished. A stream that
 * is finished without sound consists of the two header packets.
 */
class KORVEL_CORE_API OggSpeexEncoder : public Encoder {
  public:
    /** Page fill in bytes where nothing else is asked for. */
    static constexpr int PAGE_FILL_BYTES_DFLT = 4096;

    /**
     * @param info          1 channel, 2 bytes a sample; the rate chooses the mode: below 12500 Hz
     *                      narrow band, below 25000 Hz wide band, else ultra-wide band. Sound of
     *                      another format (a rate below 1 included) is an encoding that yields
     *                      no output; a line is logged.
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
    bool hasFailed() const override;

  private:
    class Impl;
    boost::scoped_ptr<Impl> impl;
};

}  // namespace Sound
