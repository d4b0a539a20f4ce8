/**
 * @file
 * Sound encoder interface.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "core/Export.h"
#include "core/sound/SoundDataBuffer.h"

namespace Sound {

/**
 * Turns sound buffers into encoded bytes that it accumulates. Used by one thread at a time, not
 * bound to a particular one.
 */
class KORVEL_CORE_API Encoder {
  public:
    virtual ~Encoder();

    /** Encodes one buffer of the format that the encoder was made for. */
    virtual void encode(const SoundDataBuffer& buffer) = 0;

    /**
     * Takes encoded bytes out of the encoder.
     * @param maxBytes the most to take; -1 for all
     * @return the bytes, possibly none, or null when there are none at all yet
     */
    virtual boost::shared_ptr<SoundDataBuffer> takeOutput(int maxBytes) = 0;

    /** Ends the stream: pads and encodes what is left and flushes the last page. */
    virtual void finish() = 0;

    /** Whether sound was lost for want of memory. Default: no. */
    virtual bool hasFailed() const;
};

}  // namespace Sound
