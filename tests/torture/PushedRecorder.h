/**
 * @file
 * A recorder whose device is the test.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>

#include "core/sound/QueuedRecorder.h"

namespace Torture {

/** Sound goes the way of a real device's: queue, event thread, listeners. */
class PushedRecorder : public Sound::QueuedRecorder {
  public:
    PushedRecorder() : QueuedRecorder("PushedRecorder") {}
    ~PushedRecorder() override { QueuedRecorder::stopRecording(); }

    /** Where the device puts its sound; null while it is closed. Under the event lock. */
    const boost::shared_ptr<Sound::CaptureQueue>& getQueue() const { return queue; }

  protected:
    bool openDevice(const Sound::RecorderFormat& /*format*/,
                    const boost::shared_ptr<Sound::CaptureQueue>& target) override {
        queue = target;
        return true;
    }
    void beginDevice() override {}
    void endDevice() override { queue.reset(); }

  private:
    boost::shared_ptr<Sound::CaptureQueue> queue;
};

}  // namespace Torture
