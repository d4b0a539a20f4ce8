#include "RelayModel.h"

namespace Lifecycle {

using Talvox::SpeechError;

// Unlike with the cloud recognizer, a second start is ignored.
void RelayModel::beginStart(int64_t /*now*/, std::optional<int> refusal) {
    if (state == State::IDLE) {
        refusalOfStart = refusal;
        state = refusal ? State::IDLE : State::RUNNING;
    }
}

std::string RelayModel::endStart() {
    const bool refused = refusalOfStart.has_value() || thrown;
    refusalOfStart.reset();
    return refused && !isOver() ? "not over after a start that could not succeed" : "";
}

std::string RelayModel::endCancel() {
    --cancels;
    return isOver() || isGone() ? "" : "not over after cancel";
}

void RelayModel::beginSaying(Event event, int errorCode) {
    said = event;
    if (isActive() && !gaveResults) {
        gaveResults = event == Event::RESULTS;
        errorSaid = event == Event::ERROR ? errorCode : errorSaid;
    }
}

std::string RelayModel::onEvent(Event event, int64_t /*now*/, int errorCode) {
    if (isGone()) {
        return "an event after the release";
    }
    if (isOver()) {
        return nameOf(event, errorCode) + " after the end";
    }
    bool allowed = false;
    if (event == Event::ERROR) {
        allowed = isPossible(errorCode);
        state = State::OVER;
    } else if (event == Event::RESULTS) {
        allowed = isActive() && gaveResults;
        state = State::OVER;
    } else {
        allowed = isActive() && said == event;
    }
    return allowed ? "" : nameOf(event, errorCode) + " that the device did not say";
}

bool RelayModel::isPossible(int errorCode) const {
    return (refusalOfStart && *refusalOfStart == errorCode) ||
           (thrown && errorCode == SpeechError::ErrorNotAvailable) ||
           (cancels > 0 && errorCode == SpeechError::ErrorCanceled) ||
           (isActive() && errorCode == errorSaid);
}

std::string RelayModel::checkSettled(int64_t /*now*/) {
    if (isGone() || !isActive()) {
        return "";
    }
    return gaveResults || errorSaid >= 0 ? "the device's session is over and nobody was told" : "";
}

}  // namespace Lifecycle
