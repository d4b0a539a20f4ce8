#include "sound/PulseRecorder.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <cstdint>
#include <memory>

#include "pal/kd_event.h"
#include "pal/kd_log.h"
#include "sound/AudioThreads.h"
#include "sound/RecorderFormat.h"

namespace Sound {

namespace {

/** The longest piece in which the server hands over sound. */
const int FRAGMENT_MS_MAX = 20;

// A server or device that is silent for good without saying so: no sound within 5 s of the start,
// or none for a second later on.
const int64_t WATCH_TICK_NS = 200000000;
const int QUIET_TICKS_AT_START_MAX = 25;
const int QUIET_TICKS_MAX = 4;

}  // namespace

PulseRecorder::PulseRecorder() : watchTimer([this] { onWatchTick(); }) {}

PulseRecorder::~PulseRecorder() {
    close();
}

bool PulseRecorder::init() {
    if (isRecording()) {
        return true;
    }
    close();
    return open();
}

void PulseRecorder::startRecording() {
    if (isRecording()) {
        return;
    }
    if (!queue) {
        open();
    }
    zeroWatch = ZeroWatch();
    if (capture) {
        capture->begin();
    }
    startWatch();
    // For a failure that showed before.
    postDelivery(weak_from_this());
    Recorder::startRecording();
}

void PulseRecorder::stopRecording() {
    close();
    Recorder::stopRecording();
}

bool PulseRecorder::open() {
    const RecorderFormat format(getSampleRate(), getBufferLength());
    const boost::weak_ptr<Recorder> self = weak_from_this();
    queue = boost::make_shared<CaptureQueue>(format, [self] { postDelivery(self); });
    if (!format.isUsable()) {
        queue->fail("unusable sample rate or buffer length");
        return false;
    }
    const RecorderFormat fragment(getSampleRate(), std::min(getBufferLength(), FRAGMENT_MS_MAX));
    capture = boost::make_shared<PulseCapture>(
        getSampleRate(), static_cast<int>(fragment.getByteCount()), getMode(), queue);
    if (!AudioThreads::instance().start(capture)) {
        capture.reset();
        queue->fail("no thread for the device");
        return false;
    }
    return true;
}

void PulseRecorder::close() {
    watchTimer.cancel();
    if (capture) {
        capture->end();
        capture.reset();
    }
    queue.reset();
}

void PulseRecorder::deliver() {
    if (!isRecording()) {
        return;
    }
    const boost::shared_ptr<CaptureQueue> source = queue;
    const CaptureQueue::Batch batch = source->take();
    for (const boost::shared_ptr<const SoundDataBuffer>& buffer : batch.buffers) {
        if (zeroWatch.isSuspicious(*buffer)) {
            kdLogFormatMessage(
                "PulseRecorder: the microphone delivers only zeros; is the microphone muted?");
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

void PulseRecorder::fail(const std::string& reason) {
    kdLogFormatMessage("PulseRecorder: %s", reason.c_str());
    stopRecording();
    notifyError();
}

void PulseRecorder::startWatch() {
    arrivalsSeen = queue->getArrivalCount();
    heardAnything = false;
    quietTicks = 0;
    watchTimer.start(KD_TIMER_ONESHOT, WATCH_TICK_NS);
}

void PulseRecorder::onWatchTick() {
    const unsigned arrivals = queue->getArrivalCount();
    if (arrivals != arrivalsSeen) {
        arrivalsSeen = arrivals;
        heardAnything = true;
        quietTicks = 0;
    } else if (++quietTicks >= (heardAnything ? QUIET_TICKS_MAX : QUIET_TICKS_AT_START_MAX)) {
        fail("the sound server sends nothing");
        return;
    }
    // Started anew each time, so that a process that stood still does not count the ticks it
    // missed.
    watchTimer.start(KD_TIMER_ONESHOT, WATCH_TICK_NS);
}

void PulseRecorder::postDelivery(const boost::weak_ptr<Recorder>& recorder) {
    kdPostKOR(&PulseRecorder::onDelivery, new boost::weak_ptr<Recorder>(recorder));
}

void PulseRecorder::onDelivery(void* user) {
    const std::unique_ptr<boost::weak_ptr<Recorder>> target(
        static_cast<boost::weak_ptr<Recorder>*>(user));
    if (const boost::shared_ptr<Recorder> recorder = target->lock()) {
        static_cast<PulseRecorder&>(*recorder).deliver();
    }
}

}  // namespace Sound
