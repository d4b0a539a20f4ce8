#pragma once

#include <boost/shared_ptr.hpp>

#include "core/sound/Recorder.h"
#include "core/sound/SoundDataBuffer.h"

namespace Cli {

/**
 * Records from the default input device, in buffers of `BUFFER_MS`, from its making to its end.
 * Buffers wait until they are taken, so that a slow terminal costs none.
 */
class Microphone {
  public:
    /** @throws UsageError if recording is not possible */
    Microphone(int sampleRateHz, Sound::Recorder::Mode mode);
    ~Microphone();
    Microphone(const Microphone&) = delete;
    Microphone& operator=(const Microphone&) = delete;

    /**
     * The next buffer, waiting for it; none after `interrupt`, or when the device failed and all
     * of its buffers were taken. One thread.
     */
    boost::shared_ptr<const Sound::SoundDataBuffer> take();

    /** Ends `take`. Any thread. */
    void interrupt();

    /** Whether the device failed: there is none, it refused, or it is gone. Any thread. */
    bool hasFailed() const;

  private:
    class Inbox;

    boost::shared_ptr<Inbox> inbox_;
    boost::shared_ptr<Sound::Recorder> recorder_;
};

}  // namespace Cli
