/**
 * @file
 * A recorder with every bad habit that a plan gives it.
 */
#pragma once

#include <functional>

#include "Plan.h"
#include "core/sound/Recorder.h"

namespace Lifecycle {

/** Under the event lock, as every recorder. */
class RecorderDouble : public Sound::Recorder {
  public:
    using Hook = std::function<void()>;

    /** @param onFailing called before an error is reported */
    RecorderDouble(const RecorderPlan& habits, Hook onFailing)
        : plan(habits), failing(std::move(onFailing)) {}

    bool init() override { return !plan.refuses; }

    void startRecording() override {
        if (plan.failsAtStart) {
            fail();
        }
        Recorder::startRecording();
    }

    void stopRecording() override {
        if (plan.flushesWhenStopped && lastBuffer) {
            notifyData(lastBuffer);
        }
        if (plan.failsWhenStopped) {
            fail();
        }
        Recorder::stopRecording();
    }

    void fail() {
        failing();
        notifyError();
    }

    /** @param rude also when it was stopped */
    void deliver(const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer, bool rude) {
        lastBuffer = buffer;
        if (isRecording() || rude) {
            notifyData(buffer);
        }
    }

  private:
    const RecorderPlan plan;
    const Hook failing;
    boost::shared_ptr<const Sound::SoundDataBuffer> lastBuffer;
};

}  // namespace Lifecycle
