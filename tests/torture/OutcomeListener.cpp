#include "OutcomeListener.h"

#include "Control.h"
#include "Words.h"
#include "pal/kd_time.h"
#include "talvox/Recognition.h"

namespace Torture {

namespace {

constexpr std::int64_t NS_PER_MS = 1000000;

}  // namespace

OutcomeListener::OutcomeListener(SessionOutcome& target) : outcome(target), began(kdGetTimeUST()) {}

void OutcomeListener::onRecordingBegin(Talvox::Recognizer* /*recognizer*/) {}

void OutcomeListener::onSpeakingBegin(Talvox::Recognizer* /*recognizer*/) {}

void OutcomeListener::onRecordingDone(Talvox::Recognizer* /*recognizer*/) {}

void OutcomeListener::onBufferReceived(Talvox::Recognizer* /*recognizer*/,
                                       const Sound::SoundDataBuffer& /*buffer*/) {
    ++buffers;
}

void OutcomeListener::onPowerChanged(Talvox::Recognizer* /*recognizer*/, float /*power*/) {}

void OutcomeListener::onResults(Talvox::Recognizer* /*recognizer*/,
                                boost::shared_ptr<Talvox::Recognition> recognition) {
    const Harness harness;
    const auto results = recognition->getResults();
    if (results->empty() || results->front().getText() != WORDS) {
        outcome.wrongText = 1;
    }
    outcome.results = 1;
    noteEnd();
}

void OutcomeListener::onError(Talvox::Recognizer* /*recognizer*/, Talvox::SpeechError error) {
    const Harness harness;
    outcome.error = error.getCode();
    noteEnd();
}

bool OutcomeListener::waitForEnd(std::chrono::milliseconds limit) {
    std::unique_lock<std::mutex> lock(mutex);
    return changed.wait_for(lock, limit, [this] { return outcome.ends > 0; });
}

bool OutcomeListener::isOver() {
    const std::lock_guard<std::mutex> lock(mutex);
    return outcome.ends > 0;
}

void OutcomeListener::noteEnd() {
    const std::lock_guard<std::mutex> lock(mutex);
    ++outcome.ends;
    outcome.endMs = (kdGetTimeUST() - began) / NS_PER_MS;
    changed.notify_all();
}

}  // namespace Torture
