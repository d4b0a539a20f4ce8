#include "sound/PulseRecorder.h"

#include <algorithm>
#include <boost/make_shared.hpp>

#include "sound/AudioThreads.h"

namespace Sound {

namespace {

/** The longest piece in which the server hands over sound. */
const int FRAGMENT_MS_MAX = 20;

}  // namespace

PulseRecorder::PulseRecorder() : QueuedRecorder("PulseRecorder") {}

PulseRecorder::~PulseRecorder() {
    QueuedRecorder::stopRecording();
}

bool PulseRecorder::openDevice(const RecorderFormat& /*format*/,
                               const boost::shared_ptr<CaptureQueue>& target) {
    const RecorderFormat fragment(getSampleRate(), std::min(getBufferLength(), FRAGMENT_MS_MAX));
    capture = boost::make_shared<PulseCapture>(
        getSampleRate(), static_cast<int>(fragment.getByteCount()), getMode(), target);
    if (!AudioThreads::instance().start(capture)) {
        capture.reset();
        target->fail("no thread for the device");
        return false;
    }
    return true;
}

void PulseRecorder::beginDevice() {
    capture->begin();
}

void PulseRecorder::endDevice() {
    capture->end();
    capture.reset();
}

}  // namespace Sound
