#include "Session.h"

#include <utility>

#include "ScriptedGateway.h"
#include "talvox/Recognition.h"

namespace Lifecycle {

void Session::own(const boost::shared_ptr<Talvox::Recognizer>& made) {
    recognizer = made;
    object = made;
    made->addListener(witness);
}

void Session::release() {
    enter();
    // It goes last: nothing may be heard from inside its end.
    const boost::shared_ptr<Talvox::Recognizer> last = std::move(recognizer);
    leave();
}

void Session::leave() {
    --frames;
    if (frames == 0 && isReleased()) {
        model.onGone();
    }
}

void SessionListener::onRecordingBegin(Talvox::Recognizer* recognizer) {
    hear(recognizer, Event::RECORDING_BEGIN);
}

void SessionListener::onSpeakingBegin(Talvox::Recognizer* recognizer) {
    hear(recognizer, Event::SPEAKING_BEGIN);
}

void SessionListener::onRecordingDone(Talvox::Recognizer* recognizer) {
    hear(recognizer, Event::RECORDING_DONE);
}

void SessionListener::onBufferReceived(Talvox::Recognizer* recognizer,
                                       const Sound::SoundDataBuffer& /*buffer*/) {
    hear(recognizer, Event::BUFFER);
}

void SessionListener::onPowerChanged(Talvox::Recognizer* recognizer, float /*power*/) {
    hear(recognizer, Event::POWER);
}

void SessionListener::onResults(Talvox::Recognizer* recognizer,
                                boost::shared_ptr<Talvox::Recognition> recognition) {
    const Talvox::RecognitionResults& results = *recognition->getResults();
    if (!results.empty() &&
        (results.size() > 1 || results[0].getText() != ScriptedGateway::makeWords(session.index))) {
        host.onWrong("the words of another session: " + results[0].getText());
    }
    if (recognition->getRequestId() != ScriptedGateway::makeRequestId(session.index)) {
        host.onWrong("the request of another session: " + recognition->getRequestId());
    }
    hear(recognizer, Event::RESULTS);
}

void SessionListener::onError(Talvox::Recognizer* recognizer, Talvox::SpeechError error) {
    hear(recognizer, Event::ERROR, error.getCode());
}

void SessionListener::hear(const Talvox::Recognizer* recognizer, Event event, int errorCode) {
    if (session.recognizer && recognizer != session.recognizer.get()) {
        host.onWrong("the event names another recognizer");
    }
    session.enter();
    host.onWrong(session.model.onEvent(event, host.now(), errorCode));
    host.onEvent(session, event, errorCode);
    session.leave();
}

}  // namespace Lifecycle
