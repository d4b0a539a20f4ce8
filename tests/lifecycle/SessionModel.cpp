#include "SessionModel.h"

namespace Lifecycle {

using Talvox::SpeechError;

namespace {

const int64_t NO_VOICE_MS = 5000;
const int64_t SOUND_MS = 20000;
const int64_t ANSWER_MS = 20000;
/** A recorder that delivers nothing is noticed after this, and at the latest after twice that. */
const int64_t NO_SOUND_MS = 10000;
/** Nobody listens longer, however slowly the sound comes. */
const int64_t LISTENING_MS = 60000;

const char* const STATE_NAMES[] = {"idle", "learning", "ready", "speaking", "sending", "over"};

std::string nameOf(int code) {
    return code >= 0 && code < SpeechError::ErrorMax ? SpeechError::errorStrings[code]
                                                     : std::to_string(code);
}

}  // namespace

void SessionModel::beginStart(int64_t now, std::optional<int> refusal) {
    if (state == State::OVER || isStandIn) {
        return;
    }
    refusalOfStart = isActive() ? SpeechError::ErrorBusy : refusal;
    if (state == State::IDLE && !refusalOfStart) {
        state = State::LEARNING;
        startTime = now;
        lastSound = now;
    }
}

std::string SessionModel::endStart() {
    const bool refused = refusalOfStart.has_value();
    refusalOfStart.reset();
    return refused || recorderFailed ? expectOver("a start that could not succeed") : "";
}

std::string SessionModel::endStop() {
    --stops;
    return isListening() ? "goes on listening after stop" : "";
}

std::string SessionModel::endCancel() {
    --cancels;
    return expectOver("cancel");
}

void SessionModel::beginSound(int64_t now, int64_t durationMs) {
    ++sounds;
    wasReady = state == State::READY;
    if (isListening()) {
        heardAnything = true;
        heardMs += durationMs;
        lastSound = durationMs > 0 ? now : lastSound;
    }
}

std::string SessionModel::endSound(int64_t now) {
    --sounds;
    if (gone) {
        return "";
    }
    if (heardMs > SOUND_MS && (state == State::READY || state == State::SPEAKING) && wasReady) {
        return "goes on listening after too much sound";
    }
    return wasReady && state == State::READY && now - startTime >= NO_VOICE_MS
               ? "goes on waiting for a voice"
               : "";
}

std::string SessionModel::onEvent(Event event, int64_t now, int errorCode) {
    if (gone) {
        return "an event after the release";
    }
    if (isStandIn) {
        return event == Event::ERROR && isPossible(errorCode, now) ? ""
                                                                   : "not what a stand-in says";
    }
    const State before = state;
    bool allowed = false;
    switch (event) {
        case Event::RECORDING_BEGIN:
            allowed = before == State::LEARNING && sounds > 0;
            state = State::READY;
            break;
        case Event::SPEAKING_BEGIN:
            allowed = before == State::READY && sounds > 0;
            state = State::SPEAKING;
            break;
        case Event::BUFFER:
        case Event::POWER:
            allowed = (before == State::READY || before == State::SPEAKING) && sounds > 0;
            break;
        case Event::RECORDING_DONE:
            allowed = isListening() && (sounds > 0 || stops > 0);
            state = State::SENDING;
            doneTime = now;
            break;
        case Event::RESULTS:
        case Event::ERROR:
            return onEnd(event, now, errorCode);
    }
    return allowed ? ""
                   : std::string(Lifecycle::nameOf(event)) + " while " +
                         STATE_NAMES[static_cast<int>(before)];
}

std::string SessionModel::onEnd(Event event, int64_t now, int errorCode) {
    const State before = state;
    if (before == State::OVER) {
        return "a second end";
    }
    const bool possible = event == Event::RESULTS ? isActive() && request == Request::ANSWERED
                                                  : isPossible(errorCode, now);
    state = State::OVER;
    return possible ? ""
                    : std::string(Lifecycle::nameOf(event)) + " " +
                          (event == Event::ERROR ? nameOf(errorCode) : "") + " while " +
                          STATE_NAMES[static_cast<int>(before)] + ", without a reason for it";
}

bool SessionModel::isPossible(int errorCode, int64_t now) const {
    if (refusalOfStart && errorCode == *refusalOfStart) {
        return true;
    }
    switch (errorCode) {
        case SpeechError::ErrorCanceled:
            return cancels > 0;
        case SpeechError::ErrorAudio:
            return recorderFailed || (stops > 0 && state == State::SENDING && !heardAnything) ||
                   (isListening() && now - lastSound >= NO_SOUND_MS) ||
                   (isListening() && now - startTime >= LISTENING_MS);
        case SpeechError::ErrorNoVoice:
            return state == State::READY && sounds > 0 && now - startTime >= NO_VOICE_MS;
        case SpeechError::ErrorNetwork:
            return isActive() && (request == Request::FAILED || request == Request::UNSENDABLE ||
                                  (state == State::SENDING && now - doneTime >= ANSWER_MS));
        case SpeechError::ErrorNotAvailable:
            return isStandIn;
        default:
            return false;
    }
}

std::string SessionModel::checkSettled(int64_t now) {
    if (gone || !isActive()) {
        return "";
    }
    if (request == Request::ANSWERED || request == Request::FAILED) {
        return "the request is over and nobody was told";
    }
    if (recorderFailed) {
        return "the recorder failed and nobody was told";
    }
    if (state == State::SENDING) {
        answerDue = answerDue.value_or(now + ANSWER_MS);
        return now >= *answerDue ? "no answer for too long" : "";
    }
    if (now - lastSound >= 2 * NO_SOUND_MS) {
        return "listens to a recorder that delivers nothing";
    }
    return now - startTime >= LISTENING_MS + NO_SOUND_MS ? "listens for too long" : "";
}

std::string SessionModel::expectOver(const char* after) const {
    return state == State::OVER || isStandIn || gone ? "" : std::string("not over after ") + after;
}

}  // namespace Lifecycle
