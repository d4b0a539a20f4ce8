/**
 * @file
 * A recorder that a test plays by hand.
 */
#pragma once

#include <functional>

#include "core/sound/Recorder.h"
#include "core/util/EventLock.h"

namespace CloudTest {

/** Delivers what the test hands it, as a recorder does: under the event lock, while it records. */
class ScriptedRecorder : public Sound::Recorder {
  public:
    bool init() override {
        initialised = true;
        if (insideInit) {
            insideInit();
        }
        return works;
    }
    void startRecording() override {
        if (insideStart) {
            insideStart();
        }
        if (failsAtStart) {
            notifyError();
        }
        Sound::Recorder::startRecording();
    }
    void stopRecording() override {
        ++stops;
        if (insideStop) {
            insideStop();
        }
        if (failsWhenStopped) {
            notifyError();
        }
        if (flushes) {
            notifyData(flushes);
        }
        Sound::Recorder::stopRecording();
    }

    /** Hands a buffer to the listeners unless recording has ended. */
    void deliver(const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer) {
        const Util::EventLock lock;
        if (isRecording()) {
            notifyData(buffer);
        }
    }

    void fail() {
        const Util::EventLock lock;
        notifyError();
    }

    std::function<void()> insideInit;
    std::function<void()> insideStart;
    std::function<void()> insideStop;
    bool works = true;
    bool failsAtStart = false;
    bool failsWhenStopped = false;
    /** Delivered from inside `stopRecording`. */
    boost::shared_ptr<const Sound::SoundDataBuffer> flushes;
    bool initialised = false;
    int stops = 0;
};

}  // namespace CloudTest
