#include "EventRecorder.h"

#include <chrono>

#include "pal/kd_time.h"

namespace CloudTest {

namespace {

const std::chrono::seconds LONGEST_WAIT{20};

}  // namespace

EventRecorder::EventRecorder() : startTime(kdGetTimeUST()) {}

void EventRecorder::onRecordingBegin(Talvox::Recognizer* recognizer) {
    add("recordingBegin", recognizer);
}

void EventRecorder::onSpeakingBegin(Talvox::Recognizer* recognizer) {
    add("speakingBegin", recognizer);
}

void EventRecorder::onRecordingDone(Talvox::Recognizer* recognizer) {
    add("recordingDone", recognizer);
}

void EventRecorder::onBufferReceived(Talvox::Recognizer* recognizer,
                                     const Sound::SoundDataBuffer& /*buffer*/) {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        ++buffers;
    }
    callHook("buffer", recognizer);
}

void EventRecorder::onPowerChanged(Talvox::Recognizer* recognizer, float power) {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        levels.push_back(power);
    }
    callHook("power", recognizer);
}

void EventRecorder::onResults(Talvox::Recognizer* recognizer,
                              boost::shared_ptr<Talvox::Recognition> recognition) {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        lastRecognition = recognition;
    }
    addEnd("results", recognizer);
}

void EventRecorder::onError(Talvox::Recognizer* recognizer, Talvox::SpeechError error) {
    {
        const std::string reason = recognizer->getErrorReason();
        const std::lock_guard<std::mutex> lock(mutex);
        lastReason = reason;
    }
    addEnd("error " + error.getErrorString(), recognizer);
}

bool EventRecorder::waitForEnds(std::size_t count) const {
    return waitForEnds(count, LONGEST_WAIT);
}

bool EventRecorder::waitForEnds(std::size_t count, std::chrono::milliseconds timeout) const {
    std::unique_lock<std::mutex> lock(mutex);
    return changed.wait_for(lock, timeout, [this, count] { return ends >= count; });
}

std::vector<std::string> EventRecorder::texts() const {
    const std::lock_guard<std::mutex> lock(mutex);
    std::vector<std::string> all;
    for (const Event& event : events) {
        all.push_back(event.text);
    }
    return all;
}

int64_t EventRecorder::timeOf(const std::string& text) const {
    const std::lock_guard<std::mutex> lock(mutex);
    for (const Event& event : events) {
        if (event.text == text) {
            return event.ms;
        }
    }
    return -1;
}

std::size_t EventRecorder::countEnds() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return ends;
}

std::size_t EventRecorder::countBuffers() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return buffers;
}

std::vector<float> EventRecorder::powers() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return levels;
}

boost::shared_ptr<Talvox::Recognition> EventRecorder::recognition() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return lastRecognition;
}

std::string EventRecorder::errorReason() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return lastReason;
}

void EventRecorder::add(const std::string& text, Talvox::Recognizer* recognizer) {
    append(text, 0);
    callHook(text, recognizer);
}

void EventRecorder::addEnd(const std::string& text, Talvox::Recognizer* recognizer) {
    append(text, 1);
    callHook(text, recognizer);
}

// A thread that waits for an end finds its text.
void EventRecorder::append(const std::string& text, std::size_t newEnds) {
    const std::lock_guard<std::mutex> lock(mutex);
    events.push_back({text, (kdGetTimeUST() - startTime) / 1000000});
    ends += newEnds;
    changed.notify_all();
}

void EventRecorder::callHook(const std::string& text, Talvox::Recognizer* recognizer) const {
    if (hook) {
        hook(text, recognizer);
    }
}

}  // namespace CloudTest
