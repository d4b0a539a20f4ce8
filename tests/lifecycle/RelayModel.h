/**
 * @file
 * What a session of the platform recognizer may do.
 */
#pragma once

#include "SessionModel.h"

namespace Lifecycle {

/**
 * Relays what the device says, in whatever order: but from the start to the one end only, and
 * nothing that was not said.
 */
class RelayModel : public SessionModel {
  public:
    bool isActive() const override { return state == State::RUNNING; }
    bool isOver() const override { return state == State::OVER; }

    void beginStart(int64_t now, std::optional<int> refusal) override;
    std::string endStart() override;
    void beginStop() override {}
    std::string endStop() override { return ""; }
    void beginCancel() override { ++cancels; }
    std::string endCancel() override;
    std::string onEvent(Event event, int64_t now, int errorCode) override;
    std::string checkSettled(int64_t now) override;

    /** The device says something that is an event of its own, or an error. */
    void beginSaying(Event event, int errorCode = -1);
    void endSaying() { said.reset(); }
    /** Starting it throws. */
    void onThrown() { thrown = true; }

  private:
    enum class State { IDLE, RUNNING, OVER };

    bool isPossible(int errorCode) const;

    State state = State::IDLE;
    int cancels = 0;
    std::optional<int> refusalOfStart;
    std::optional<Event> said;
    bool gaveResults = false;
    bool thrown = false;
    int errorSaid = -1;
};

}  // namespace Lifecycle
