/**
 * @file
 * What a session of the platform recognizer may do.
 */
#pragma once

#include "SessionModel.h"

namespace Lifecycle {

/**
 * Relays what the device says, in whatever order: but from the start to the one end only, and
 * nothing that was not said. A device that is silent for too long ends the session.
 */
class RelayModel : public SessionModel {
  public:
    static constexpr int64_t SILENCE_LIMIT_MS = 30000;
    static constexpr int64_t ANSWER_LIMIT_MS = 20000;

    bool isActive() const override { return state == State::RUNNING; }
    bool isOver() const override { return state == State::OVER; }

    void beginStart(int64_t now, std::optional<int> refusal) override;
    std::string endStart() override;
    void beginStop(int64_t now) override { awaitAnswer(now); }
    std::string endStop() override;
    void beginCancel() override { ++cancels; }
    std::string endCancel() override;
    std::string onEvent(Event event, int64_t now, int errorCode) override;
    std::string checkSettled(int64_t now) override;

    /** The device says anything. */
    void onHeard(int64_t now);
    /** The device says something that is an event of its own, or an error. */
    void beginSaying(Event event, int64_t now, int errorCode = -1);
    void endSaying() { said.reset(); }
    /** The device throws; where it has not given results, that is this error. */
    void onThrown(int errorCode) { errorThrown = errorCode; }

  private:
    enum class State { IDLE, RUNNING, OVER };

    bool isPossible(int errorCode, int64_t now) const;
    void awaitAnswer(int64_t now);

    State state = State::IDLE;
    int cancels = 0;
    std::optional<int> refusalOfStart;
    std::optional<Event> said;
    bool gaveResults = false;
    std::optional<int> errorThrown;
    int errorSaid = -1;
    bool answerAwaited = false;
    int64_t deadline = 0;
};

}  // namespace Lifecycle
