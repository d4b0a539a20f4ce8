#include "SessionListener.h"

#include <utility>

#include "core/sound/ZeroWatch.h"
#include "core/util/Time.h"
#include "pal/kd_time.h"
#include "talvox/Recognizer.h"

namespace Cli {

SessionListener::SessionListener(boost::shared_ptr<EventQueue> events)
    : queue(std::move(events)), startTime(kdGetTimeUST()) {}

SessionEvent SessionListener::make(SessionEvent::Kind kind) const {
    SessionEvent event;
    event.kind = kind;
    event.ms = (kdGetTimeUST() - startTime) / Util::NS_PER_MS;
    return event;
}

void SessionListener::onRecordingBegin(Talvox::Recognizer* /*recognizer*/) {
    queue->put(make(SessionEvent::RECORDING_BEGIN));
}

void SessionListener::onSpeakingBegin(Talvox::Recognizer* /*recognizer*/) {
    queue->put(make(SessionEvent::SPEAKING_BEGIN));
}

void SessionListener::onRecordingDone(Talvox::Recognizer* /*recognizer*/) {
    queue->put(make(SessionEvent::RECORDING_DONE));
}

void SessionListener::onBufferReceived(Talvox::Recognizer* /*recognizer*/,
                                       const Sound::SoundDataBuffer& buffer) {
    isSilence = Sound::ZeroWatch::isSilence(buffer);
}

void SessionListener::onPowerChanged(Talvox::Recognizer* /*recognizer*/, float power) {
    SessionEvent event = make(SessionEvent::POWER);
    event.levelDb = power;
    event.isSilence = isSilence;
    queue->put(event);
}

void SessionListener::onResults(Talvox::Recognizer* /*recognizer*/,
                                boost::shared_ptr<Talvox::Recognition> recognition) {
    SessionEvent event = make(SessionEvent::RESULTS);
    event.recognition = std::move(recognition);
    queue->put(event);
}

void SessionListener::onError(Talvox::Recognizer* recognizer, Talvox::SpeechError error) {
    SessionEvent event = make(SessionEvent::FAILURE);
    event.errorCode = error.getCode();
    event.reason = recognizer->getErrorReason();
    queue->put(event);
}

}  // namespace Cli
