#include "core/sound/FileRecorder.h"

#include <algorithm>
#include <utility>

#include "core/sound/RecorderFormat.h"
#include "core/util/Time.h"
#include "pal/kd_event.h"
#include "pal/kd_time.h"

namespace Sound {

namespace {

using Util::NS_PER_MS;

/** The shortest time of a timer: it fires as soon as the event lock is free. */
const int64_t SOONEST_NS = 1;

}  // namespace

FileRecorder::FileRecorder(std::vector<int16_t> samples, int deviceDelayMs)
    : sound(std::move(samples)),
      deviceDelayNs(std::max(deviceDelayMs, 0) * NS_PER_MS),
      timer([this] { onTimer(); }) {}

FileRecorder::~FileRecorder() = default;

bool FileRecorder::init() {
    return RecorderFormat(getSampleRate(), getBufferLength()).isUsable();
}

void FileRecorder::startRecording() {
    if (init()) {
        isOpen = false;
        timer.start(KD_TIMER_ONESHOT, SOONEST_NS);
    }
    Recorder::startRecording();
}

void FileRecorder::stopRecording() {
    timer.cancel();
    Recorder::stopRecording();
}

void FileRecorder::onTimer() {
    if (!RecorderFormat(getSampleRate(), getBufferLength()).isUsable()) {
        return;
    }
    if (isOpen) {
        deliver();
    } else {
        open();
    }
}

void FileRecorder::open() {
    isOpen = true;
    openTime = kdGetTimeUST() - SOONEST_NS;
    samplesDelivered = 0;
    awaitBuffer();
}

void FileRecorder::awaitBuffer() {
    const RecorderFormat format(getSampleRate(), getBufferLength());
    const int64_t due =
        openTime + deviceDelayNs + format.getDurationNs(samplesDelivered + format.getSampleCount());
    timer.start(KD_TIMER_ONESHOT, due - kdGetTimeUST());
}

void FileRecorder::deliver() {
    const RecorderFormat format(getSampleRate(), getBufferLength());
    const boost::shared_ptr<SoundDataBuffer> buffer = buffers.take(format.getInfo());
    std::vector<unsigned char>& bytes = buffer->getData();
    bytes.assign(format.getByteCount(), 0);
    const std::size_t count =
        std::min(sound.size() - position, static_cast<std::size_t>(format.getSampleCount()));
    for (std::size_t i = 0; i < count; ++i) {
        const auto sample = static_cast<uint16_t>(sound[position + i]);
        bytes[2 * i] = static_cast<unsigned char>(sample & 0xFFU);
        bytes[2 * i + 1] = static_cast<unsigned char>(sample >> 8);
    }
    position += count;
    samplesDelivered += format.getSampleCount();
    // First, since a listener may stop or drop this recorder.
    awaitBuffer();
    notifyData(buffer);
}

}  // namespace Sound
