#include "CloudModel.h"

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

std::string nameOfState(CloudModel::State state) {
    static const char* const NAMES[] = {"idle", "learning", "ready", "speaking", "sending", "over"};
    return NAMES[static_cast<int>(state)];
}

}  // namespace

void CloudModel::beginStart(int64_t now, std::optional<int> refusal) {
    if (state == State::OVER) {
        return;
    }
    refusalOfStart = isActive() ? SpeechError::ErrorBusy : refusal;
    if (state == State::IDLE && !refusalOfStart) {
        state = State::LEARNING;
        startTime = now;
        lastSound = now;
    }
}

std::string CloudModel::endStart() {
    const bool refused = refusalOfStart.has_value();
    refusalOfStart.reset();
    return refused || recorderFailed ? expectOver("a start that could not succeed") : "";
}

std::string CloudModel::endStop() {
    --stops;
    return isListening() ? "goes on listening after stop" : "";
}

std::string CloudModel::endCancel() {
    --cancels;
    return expectOver("cancel");
}

void CloudModel::beginSound(int64_t now, int64_t durationMs) {
    ++sounds;
    stateBeforeSound = state;
    if (isListening()) {
        heardAnything = true;
        heardMs += durationMs;
        lastSound = durationMs > 0 ? now : lastSound;
    }
}

std::string CloudModel::endSound(int64_t now) {
    --sounds;
    // What comes while the noise is learned decides nothing.
    if (isGone() || !isDetecting() || stateBeforeSound == State::LEARNING) {
        return "";
    }
    if (heardMs > SOUND_MS) {
        return "goes on listening after too much sound";
    }
    return state == State::READY && now - startTime >= NO_VOICE_MS ? "goes on waiting for a voice"
                                                                   : "";
}

std::string CloudModel::onEvent(Event event, int64_t now, int errorCode) {
    if (isGone()) {
        return "an event after the release";
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
            allowed = isDetecting() && sounds > 0;
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
    return allowed ? "" : nameOf(event, errorCode) + " while " + nameOfState(before);
}

std::string CloudModel::onEnd(Event event, int64_t now, int errorCode) {
    const State before = state;
    if (before == State::OVER) {
        return "a second end";
    }
    const bool possible = event == Event::RESULTS ? isActive() && request == Request::ANSWERED
                                                  : isPossible(errorCode, now);
    state = State::OVER;
    return possible ? ""
                    : nameOf(event, errorCode) + " while " + nameOfState(before) +
                          ", without a reason for it";
}

bool CloudModel::isPossible(int errorCode, int64_t now) const {
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
        default:
            return false;
    }
}

std::string CloudModel::checkSettled(int64_t now) {
    if (isGone() || !isActive()) {
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

std::string CloudModel::expectOver(const char* after) const {
    return state == State::OVER || isGone() ? "" : std::string("not over after ") + after;
}

}  // namespace Lifecycle
