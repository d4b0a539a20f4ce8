#include "CourseListener.h"

#include "Control.h"
#include "Words.h"
#include "pal/kd_time.h"
#include "talvox/Recognition.h"

namespace Torture {

namespace {

constexpr std::int64_t NS_PER_MS = 1000000;

}  // namespace

CourseListener::CourseListener(Course& target) : course(target), began(kdGetTimeUST()) {}

void CourseListener::onRecordingBegin(Talvox::Recognizer* /*recognizer*/) {}

void CourseListener::onSpeakingBegin(Talvox::Recognizer* /*recognizer*/) {}

void CourseListener::onRecordingDone(Talvox::Recognizer* /*recognizer*/) {}

void CourseListener::onBufferReceived(Talvox::Recognizer* /*recognizer*/,
                                      const Sound::SoundDataBuffer& /*buffer*/) {
    ++buffers;
}

void CourseListener::onPowerChanged(Talvox::Recognizer* /*recognizer*/, float /*power*/) {}

void CourseListener::onResults(Talvox::Recognizer* /*recognizer*/,
                               boost::shared_ptr<Talvox::Recognition> recognition) {
    const Harness harness;
    const auto results = recognition->getResults();
    if (results->empty() || results->front().getText() != WORDS) {
        course.wrongText = 1;
    }
    course.results = 1;
    noteEnd();
}

void CourseListener::onError(Talvox::Recognizer* /*recognizer*/, Talvox::SpeechError error) {
    const Harness harness;
    course.error = error.getCode();
    noteEnd();
}

bool CourseListener::waitForEnd(std::chrono::milliseconds limit) {
    std::unique_lock<std::mutex> lock(mutex);
    return changed.wait_for(lock, limit, [this] { return course.ends > 0; });
}

bool CourseListener::isOver() {
    const std::lock_guard<std::mutex> lock(mutex);
    return course.ends > 0;
}

void CourseListener::noteEnd() {
    const std::lock_guard<std::mutex> lock(mutex);
    ++course.ends;
    course.endMs = (kdGetTimeUST() - began) / NS_PER_MS;
    changed.notify_all();
}

}  // namespace Torture
