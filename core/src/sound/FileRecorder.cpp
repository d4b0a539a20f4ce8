#include "core/sound/FileRecorder.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <utility>

#include "core/sound/RecorderFormat.h"
#include "pal/kd_event.h"

namespace Sound {

namespace {

const int64_t NS_PER_MS = 1000000;

}  // namespace

FileRecorder::FileRecorder(std::vector<int16_t> samples)
    : sound(std::move(samples)), timer([this] { deliver(); }) {}

FileRecorder::~FileRecorder() = default;

bool FileRecorder::init() {
    return RecorderFormat(getSampleRate(), getBufferLength()).isUsable();
}

void FileRecorder::startRecording() {
    if (init()) {
        timer.start(KD_TIMER_PERIODIC_AVERAGE, getBufferLength() * NS_PER_MS);
    }
    Recorder::startRecording();
}

void FileRecorder::stopRecording() {
    timer.cancel();
    Recorder::stopRecording();
}

void FileRecorder::deliver() {
    const RecorderFormat format(getSampleRate(), getBufferLength());
    if (!format.isUsable()) {
        return;
    }
    std::vector<unsigned char> bytes(format.getByteCount());
    const std::size_t count =
        std::min(sound.size() - position, static_cast<std::size_t>(format.getSampleCount()));
    for (std::size_t i = 0; i < count; ++i) {
        const auto sample = static_cast<uint16_t>(sound[position + i]);
        bytes[2 * i] = static_cast<unsigned char>(sample & 0xFFU);
        bytes[2 * i + 1] = static_cast<unsigned char>(sample >> 8);
    }
    position += count;
    notifyData(boost::make_shared<SoundDataBuffer>(format.getInfo(), std::move(bytes)));
}

}  // namespace Sound
