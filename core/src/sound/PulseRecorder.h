#pragma once

#include <boost/shared_ptr.hpp>
#include <string>

#include "core/sound/Recorder.h"
#include "core/util/Timer.h"
#include "sound/CaptureQueue.h"
#include "sound/PulseCapture.h"
#include "sound/ZeroWatch.h"

namespace Sound {

/** Records from the default source of a PulseAudio server, or of PipeWire in its place. */
class PulseRecorder : public Recorder {
  public:
    PulseRecorder();
    ~PulseRecorder() override;

    bool init() override;
    void startRecording() override;
    void stopRecording() override;

  private:
    bool open();
    void close();
    void deliver();
    void fail(const std::string& reason);
    void startWatch();
    void onWatchTick();
    static void postDelivery(const boost::weak_ptr<Recorder>& recorder);
    static void onDelivery(void* user);

    boost::shared_ptr<CaptureQueue> queue;
    boost::shared_ptr<PulseCapture> capture;
    ZeroWatch zeroWatch;
    unsigned arrivalsSeen = 0;
    bool heardAnything = false;
    int quietTicks = 0;
    Util::Timer watchTimer;
};

}  // namespace Sound
