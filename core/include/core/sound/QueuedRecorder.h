/**
 * @file
 * What the recorders of devices have in common.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <string>

#include "core/Export.h"
#include "core/sound/CaptureQueue.h"
#include "core/sound/Recorder.h"
#include "core/sound/RecorderFormat.h"
#include "core/sound/ZeroWatch.h"
#include "core/util/Timer.h"

namespace Sound {

/**
 * Delivers on the event thread what a device's own thread puts into a queue. Reports a failed
 * device, one that falls silent, and a microphone that is muted. A derived class opens, starts and
 * ends the device, and calls `stopRecording` in its destructor.
 */
class KORVEL_CORE_API QueuedRecorder : public Recorder {
  public:
    bool init() override;
    void startRecording() override;
    void stopRecording() override;

  protected:
    /** @param recorderName begins every line in the log */
    explicit QueuedRecorder(std::string recorderName);
    ~QueuedRecorder() override;

    /**
     * Opens the device. What cannot be told without waiting for the device goes into the queue.
     * @param format usable
     * @param target where the device's thread puts its sound; taken by shared pointer
     * @return false when recording is not possible
     */
    virtual bool openDevice(const RecorderFormat& format,
                            const boost::shared_ptr<CaptureQueue>& target) = 0;

    /** Lets the opened device record. Never waits. */
    virtual void beginDevice() = 0;

    /** Lets go of the device, if there is one. Never waits. */
    virtual void endDevice() = 0;

  private:
    class Delivery;

    bool open();
    void close();
    void deliver();
    void fail(const std::string& reason);
    void startWatch();
    void onWatchTick();
    static void post(const boost::shared_ptr<Delivery>& delivery);
    static void onDelivery(void* user);

    const std::string name;
    boost::shared_ptr<CaptureQueue> queue;
    bool hasDevice = false;
    ZeroWatch zeroWatch;
    unsigned arrivalsSeen = 0;
    bool heardAnything = false;
    int quietTicks = 0;
    Util::Timer watchTimer;
};

}  // namespace Sound
