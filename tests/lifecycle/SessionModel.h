/**
 * @file
 * What a session may do: the contract of docs/LIFECYCLE.md as a machine.
 */
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "Plan.h"
#include "talvox/SpeechError.h"

namespace Lifecycle {

/**
 * The states of one session and the events that each allows. It is told what is done to the session
 * and hears what the listener hears; every operation returns what is wrong, empty for nothing.
 * Times are in milliseconds on the platform clock.
 */
class SessionModel {
  public:
    enum class State {
        IDLE,
        LEARNING, /**< started; the background noise is being learned */
        READY,    /**< recordingBegin was heard */
        SPEAKING, /**< speakingBegin was heard */
        SENDING,  /**< recordingDone was heard */
        OVER      /**< the one end was heard */
    };
    enum class Request {
        RUNNING,
        UNSENDABLE, /**< fails as soon as it is made */
        ANSWERED,
        FAILED
    };

    /** @param standIn a session without a recogniser: every call is answered with one error */
    explicit SessionModel(bool standIn = false) : isStandIn(standIn) {}

    State getState() const { return state; }
    bool isListening() const {
        return state == State::LEARNING || state == State::READY || state == State::SPEAKING;
    }
    /** Whether it is the one that is registered with the engine. */
    bool isActive() const { return isListening() || state == State::SENDING; }

    /** Begin and end of calls, which may be nested. `refusal`: what is against starting now. */
    void beginStart(int64_t now, std::optional<int> refusal);
    std::string endStart();
    void beginStop() { ++stops; }
    std::string endStop();
    void beginCancel() { ++cancels; }
    std::string endCancel();
    /** A buffer that the recorder delivers, of so many whole milliseconds. */
    void beginSound(int64_t now, int64_t durationMs);
    std::string endSound(int64_t now);
    void onRecorderFailed() { recorderFailed = true; }
    void onRequest(Request what) { request = what; }

    std::string onEvent(Event event, int64_t now, int errorCode = -1);

    /** Everything that was to happen at this time has happened. */
    std::string checkSettled(int64_t now);

    /** The application let go of it, and no call of it is under way any more. */
    void onGone() { gone = true; }
    bool isGone() const { return gone; }

  private:
    std::string onEnd(Event event, int64_t now, int errorCode);
    bool isPossible(int errorCode, int64_t now) const;
    std::string expectOver(const char* after) const;

    const bool isStandIn;
    State state = State::IDLE;
    bool gone = false;

    // Calls that are under way.
    int stops = 0;
    int cancels = 0;
    int sounds = 0;
    std::optional<int> refusalOfStart;
    int answersOfStandIn = 0;

    // What the end may come from.
    bool recorderFailed = false;
    bool heardAnything = false;
    bool wasReady = false;
    int64_t heardMs = 0;
    Request request = Request::RUNNING;
    int64_t startTime = 0;
    int64_t lastSound = 0;
    int64_t doneTime = 0;
    std::optional<int64_t> answerDue;
};

}  // namespace Lifecycle
