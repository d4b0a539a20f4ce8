#pragma once

#include <boost/shared_ptr.hpp>

#include "core/sound/QueuedRecorder.h"
#include "sound/PulseCapture.h"

namespace Sound {

/** Records from the default source of a PulseAudio server, or of PipeWire in its place. */
class PulseRecorder : public QueuedRecorder {
  public:
    PulseRecorder();
    ~PulseRecorder() override;

  protected:
    bool openDevice(const RecorderFormat& format,
                    const boost::shared_ptr<CaptureQueue>& target) override;
    void beginDevice() override;
    void endDevice() override;

  private:
    boost::shared_ptr<PulseCapture> capture;
};

}  // namespace Sound
