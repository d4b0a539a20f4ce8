#include "talvox/impl/TestRecorder.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <boost/make_shared.hpp>
#include <cstdint>
#include <utility>
#include <vector>

#include "core/util/EventLock.h"
#include "core/util/Time.h"
#include "pal/kd.h"

namespace Talvox {

namespace {

const int SAMPLES_PER_BUFFER = 1600;
const int CHANNELS = 1;
const int SAMPLE_SIZE = 2;
const std::size_t BYTES_PER_BUFFER = std::size_t{SAMPLES_PER_BUFFER} * CHANNELS * SAMPLE_SIZE;
using Util::NS_PER_MS;

}  // namespace

const char* const TestRecorder::PATH = "/mnt/sdcard/test.pcm";

TestRecorder::TestRecorder() : TestRecorder(PATH) {}

TestRecorder::TestRecorder(std::string file)
    : timer([this] { onTimerCallback(); }), path(std::move(file)) {}

TestRecorder::~TestRecorder() {
    const Util::EventLock lock;
    timer.cancel();
    closeFile();
}

bool TestRecorder::init() {
    return true;
}

void TestRecorder::startRecording() {
    closeFile();
    fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
        kdLogFormatMessage("Error opening file");
        notifyError();
    }
    timer.start(KD_TIMER_PERIODIC_AVERAGE, getBufferLength() * NS_PER_MS);
    Sound::Recorder::startRecording();
}

void TestRecorder::stopRecording() {
    closeFile();
    timer.cancel();
    Sound::Recorder::stopRecording();
}

void TestRecorder::closeFile() {
    if (fd >= 0) {
        close(fd);
        fd = -1;
    }
}

void TestRecorder::onTimerCallback() {
    const Sound::SoundDataInfo info(Sound::SoundDataInfo::NONE, CHANNELS, getSampleRate(),
                                    SAMPLE_SIZE, SAMPLES_PER_BUFFER);
    auto buffer = boost::make_shared<Sound::SoundDataBuffer>(
        info, std::vector<unsigned char>(BYTES_PER_BUFFER));
    std::vector<unsigned char>& data = buffer->getData();
    if (fd < 0 || read(fd, data.data(), data.size()) < 1) {
        std::fill(data.begin(), data.end(), static_cast<unsigned char>(0));
    }
    notifyData(buffer);
}

}  // namespace Talvox
