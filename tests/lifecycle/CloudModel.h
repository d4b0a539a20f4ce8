/**
 * @file
 * What a session of the cloud recognizer may do: the contract of docs/LIFECYCLE.md as a machine.
 */
#pragma once

#include "SessionModel.h"

namespace Lifecycle {

/** The states, the events that each allows, and the reasons that there may be for an end. */
class CloudModel : public SessionModel {
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

    bool isActive() const override { return isListening() || state == State::SENDING; }
    bool isListening() const override { return state == State::LEARNING || isDetecting(); }
    bool isOver() const override { return state == State::OVER; }

    void beginStart(int64_t now, std::optional<int> refusal) override;
    std::string endStart() override;
    void beginStop(int64_t /*now*/) override { ++stops; }
    std::string endStop() override;
    void beginCancel() override { ++cancels; }
    std::string endCancel() override;
    std::string onEvent(Event event, int64_t now, int errorCode) override;
    std::string checkSettled(int64_t now) override;

    /** A buffer that the recorder delivers, of so many whole milliseconds. */
    void beginSound(int64_t now, int64_t durationMs);
    std::string endSound(int64_t now);
    void onRecorderFailed() { recorderFailed = true; }
    void onRequest(Request what) { request = what; }

  private:
    bool isDetecting() const { return state == State::READY || state == State::SPEAKING; }
    std::string onEnd(Event event, int64_t now, int errorCode);
    bool isPossible(int errorCode, int64_t now) const;
    std::string expectOver(const char* after) const;

    State state = State::IDLE;

    // Calls that are under way.
    int stops = 0;
    int cancels = 0;
    int sounds = 0;
    std::optional<int> refusalOfStart;
    State stateBeforeSound = State::IDLE;

    // What an end may come from.
    bool recorderFailed = false;
    bool heardAnything = false;
    int64_t heardMs = 0;
    Request request = Request::RUNNING;
    int64_t startTime = 0;
    int64_t lastSound = 0;
    int64_t doneTime = 0;
    std::optional<int64_t> answerDue;
};

}  // namespace Lifecycle
