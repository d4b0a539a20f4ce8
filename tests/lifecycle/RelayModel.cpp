#include "RelayModel.h"

#include <limits>

namespace Lifecycle {

using Talvox::SpeechError;

namespace {

const int64_t NEVER = std::numeric_limits<int64_t>::max();

}  // namespace

// Unlike with the cloud recognizer, a second start is ignored.
void RelayModel::beginStart(int64_t now, std::optional<int> refusal) {
    if (state == State::IDLE) {
        deadline = now + SILENCE_LIMIT_MS;
        refusalOfStart = refusal;
        state = refusal ? State::IDLE : State::RUNNING;
    }
}

std::string RelayModel::endStart() {
    const bool refused = refusalOfStart.has_value() || errorThrown.has_value();
    refusalOfStart.reset();
    return refused && !isOver() ? "not over after a start that could not succeed" : "";
}

std::string RelayModel::endStop() {
    return errorThrown && !gaveResults && isActive() ? "not over after a stop that failed" : "";
}

std::string RelayModel::endCancel() {
    --cancels;
    return isOver() || isGone() ? "" : "not over after cancel";
}

void RelayModel::onHeard(int64_t now) {
    // What it says while it is cancelled for its silence comes too late.
    if (!answerAwaited && !gaveResults && now < deadline) {
        deadline = now + SILENCE_LIMIT_MS;
    }
}

void RelayModel::awaitAnswer(int64_t now) {
    if (isActive() && !gaveResults && !answerAwaited && now < deadline) {
        answerAwaited = true;
        deadline = now + ANSWER_LIMIT_MS;
    }
}

void RelayModel::beginSaying(Event event, int64_t now, int errorCode) {
    said = event;
    if (event == Event::RECORDING_DONE) {
        awaitAnswer(now);
    }
    if (isActive() && !gaveResults) {
        gaveResults = event == Event::RESULTS;
        deadline = gaveResults && now < deadline ? NEVER : deadline;
        errorSaid = event == Event::ERROR ? errorCode : errorSaid;
    }
}

std::string RelayModel::onEvent(Event event, int64_t now, int errorCode) {
    if (isGone()) {
        return "an event after the release";
    }
    if (isOver()) {
        return nameOf(event, errorCode) + " after the end";
    }
    bool allowed = false;
    if (event == Event::ERROR) {
        allowed = isPossible(errorCode, now);
        state = State::OVER;
    } else if (event == Event::RESULTS) {
        allowed = isActive() && gaveResults;
        state = State::OVER;
    } else {
        allowed = isActive() && said == event;
    }
    return allowed ? "" : nameOf(event, errorCode) + " that the device did not say";
}

bool RelayModel::isPossible(int errorCode, int64_t now) const {
    return (refusalOfStart && *refusalOfStart == errorCode) ||
           (errorThrown && errorCode == *errorThrown) ||
           (cancels > 0 && errorCode == SpeechError::ErrorCanceled) ||
           (isActive() && errorCode == errorSaid) ||
           (isActive() && now >= deadline && errorCode == SpeechError::ErrorNetwork);
}

std::string RelayModel::checkSettled(int64_t now) {
    if (isGone() || !isActive()) {
        return "";
    }
    if (gaveResults || errorSaid >= 0) {
        return "the device's session is over and nobody was told";
    }
    return now >= deadline ? "the device is silent for too long" : "";
}

}  // namespace Lifecycle
