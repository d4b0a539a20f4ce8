#include "Session.h"

#include <utility>

#include "ScriptedGateway.h"
#include "talvox/Recognition.h"

namespace Lifecycle {

namespace {

std::unique_ptr<SessionModel> makeModel(Kind kind) {
    switch (kind) {
        case Kind::CLOUD:
            return std::make_unique<CloudModel>();
        case Kind::PLATFORM:
            return std::make_unique<RelayModel>();
        case Kind::STAND_IN:
            break;
    }
    return std::make_unique<StandInModel>();
}

}  // namespace

Session::Session(SessionHost& owner, int number, const SessionPlan& what, Kind served)
    : index(number),
      plan(what),
      kind(served),
      model(makeModel(served)),
      cloud(dynamic_cast<CloudModel*>(model.get())),
      relay(dynamic_cast<RelayModel*>(model.get())),
      listener(boost::make_shared<SessionListener>(owner, *this)),
      witness(boost::make_shared<Witness>(owner, served == Kind::STAND_IN)) {}

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
        model->onGone();
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
    const bool hasRequest = session.kind == Kind::CLOUD;
    if (recognition->getRequestId() !=
        (hasRequest ? ScriptedGateway::makeRequestId(session.index) : std::string())) {
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
    host.onWrong(session.model->onEvent(event, host.now(), errorCode));
    host.onEvent(session, event, errorCode);
    session.leave();
}

}  // namespace Lifecycle
