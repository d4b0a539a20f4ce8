#include "core/sound/QueuedRecorder.h"

#include <boost/make_shared.hpp>
#include <cstdint>
#include <mutex>
#include <utility>

#include "pal/kd_event.h"
#include "pal/kd_log.h"

namespace Sound {

namespace {

// A server or device that is silent for good without saying so: no sound within 5 s of the start,
// or none for a second later on.
const int64_t WATCH_TICK_NS = 200000000;
const int QUIET_TICKS_AT_START_MAX = 25;
const int QUIET_TICKS_MAX = 4;

}  // namespace

/** Can be posted again and again without any allocation; keeps itself while it is posted. */
class QueuedRecorder::Delivery {
  public:
    explicit Delivery(const boost::weak_ptr<Recorder>& target) : recorder(target) {}

    void hold(const boost::shared_ptr<Delivery>& itself) {
        const std::lock_guard<std::mutex> lock(mutex);
        self = itself;
        ++posts;
    }

    /** @return what held the object for the post; never null */
    boost::shared_ptr<Delivery> release() {
        const std::lock_guard<std::mutex> lock(mutex);
        return --posts == 0 ? std::move(self) : self;
    }

    const boost::weak_ptr<Recorder> recorder;

  private:
    std::mutex mutex;  // guards what follows
    boost::shared_ptr<Delivery> self;
    int posts = 0;
};

QueuedRecorder::QueuedRecorder(std::string recorderName)
    : name(std::move(recorderName)), watchTimer([this] { onWatchTick(); }) {}

QueuedRecorder::~QueuedRecorder() = default;

bool QueuedRecorder::init() {
    if (isRecording()) {
        return true;
    }
    close();
    return open();
}

void QueuedRecorder::startRecording() {
    if (isRecording()) {
        return;
    }
    if (!queue) {
        open();
    }
    zeroWatch = ZeroWatch();
    if (hasDevice) {
        beginDevice();
    }
    startWatch();
    // For a failure that showed before.
    post(boost::make_shared<Delivery>(weak_from_this()));
    Recorder::startRecording();
}

void QueuedRecorder::stopRecording() {
    close();
    Recorder::stopRecording();
}

bool QueuedRecorder::open() {
    const RecorderFormat format(getSampleRate(), getBufferLength());
    const auto delivery = boost::make_shared<Delivery>(weak_from_this());
    queue = boost::make_shared<CaptureQueue>(format, [delivery] { post(delivery); });
    if (!format.isUsable()) {
        queue->fail("unusable sample rate or buffer length");
        return false;
    }
    hasDevice = openDevice(format, queue);
    if (!hasDevice) {
        queue->fail("no device to record from");
    }
    return hasDevice;
}

void QueuedRecorder::close() {
    watchTimer.cancel();
    if (hasDevice) {
        hasDevice = false;
        endDevice();
    }
    queue.reset();
}

void QueuedRecorder::deliver() {
    if (!isRecording()) {
        return;
    }
    const boost::shared_ptr<CaptureQueue> source = queue;
    const CaptureQueue::Batch& batch = source->take();
    for (const boost::shared_ptr<const SoundDataBuffer>& buffer : batch.buffers) {
        if (zeroWatch.isSuspicious(*buffer)) {
            kdLogFormatMessage("%s: the microphone delivers only zeros; is the microphone muted?",
                               name.c_str());
        }
        notifyData(buffer);
        if (queue != source) {
            return;
        }
    }
    if (batch.failed) {
        fail(batch.reason);
    }
}

void QueuedRecorder::fail(const std::string& reason) {
    kdLogFormatMessage("%s: %s", name.c_str(), reason.c_str());
    stopRecording();
    notifyError();
}

void QueuedRecorder::startWatch() {
    arrivalsSeen = queue->getArrivalCount();
    heardAnything = false;
    quietTicks = 0;
    watchTimer.start(KD_TIMER_ONESHOT, WATCH_TICK_NS);
}

void QueuedRecorder::onWatchTick() {
    // For sound whose wake-up was lost for want of memory.
    deliver();
    if (!isRecording()) {
        return;
    }
    const unsigned arrivals = queue->getArrivalCount();
    if (arrivals != arrivalsSeen) {
        arrivalsSeen = arrivals;
        heardAnything = true;
        quietTicks = 0;
    } else if (++quietTicks >= (heardAnything ? QUIET_TICKS_MAX : QUIET_TICKS_AT_START_MAX)) {
        fail("the device sends nothing");
        return;
    }
    // Started again each time, so that a process that stood still does not count the ticks it
    // missed.
    watchTimer.start(KD_TIMER_ONESHOT, WATCH_TICK_NS);
}

// On the device's thread, which must not allocate.
void QueuedRecorder::post(const boost::shared_ptr<Delivery>& delivery) {
    delivery->hold(delivery);
    if (kdPostKOR(&QueuedRecorder::onDelivery, delivery.get()) != 0) {
        delivery->release();
    }
}

void QueuedRecorder::onDelivery(void* user) {
    const boost::shared_ptr<Delivery> delivery = static_cast<Delivery*>(user)->release();
    if (const boost::shared_ptr<Recorder> recorder = delivery->recorder.lock()) {
        static_cast<QueuedRecorder&>(*recorder).deliver();
    }
}

}  // namespace Sound
