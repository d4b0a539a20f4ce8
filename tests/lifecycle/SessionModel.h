/**
 * @file
 * What a session may do: what every kind of session has in common.
 */
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "Plan.h"
#include "talvox/SpeechError.h"

namespace Lifecycle {

/**
 * Is told what is done to the session and hears what its listener hears. Operations that return a
 * text return what is wrong, empty for nothing. Times are in milliseconds on the platform clock.
 * Calls may be nested.
 */
class SessionModel {
  public:
    SessionModel() = default;
    virtual ~SessionModel() = default;
    SessionModel(const SessionModel&) = delete;
    SessionModel& operator=(const SessionModel&) = delete;

    /** Whether it is the one that is registered with the engine. */
    virtual bool isActive() const = 0;
    /** Whether its recorder runs. */
    virtual bool isListening() const { return false; }
    virtual bool isOver() const = 0;

    /** @param refusal the error that is due when the session starts now */
    virtual void beginStart(int64_t now, std::optional<int> refusal) = 0;
    virtual std::string endStart() = 0;
    virtual void beginStop(int64_t now) = 0;
    virtual std::string endStop() = 0;
    virtual void beginCancel() = 0;
    virtual std::string endCancel() = 0;

    /** @param errorCode of an error */
    virtual std::string onEvent(Event event, int64_t now, int errorCode) = 0;

    /** Everything that was to happen at this time has happened. */
    virtual std::string checkSettled(int64_t now) = 0;

    /** The application let go of it, and no call of it is under way any more. */
    void onGone() { gone = true; }
    bool isGone() const { return gone; }

  protected:
    static std::string nameOf(Event event, int errorCode) {
        return Lifecycle::nameOf(event) +
               (event == Event::ERROR
                    ? " " + Talvox::SpeechError::errorStrings[static_cast<std::size_t>(errorCode)]
                    : std::string());
    }

  private:
    bool gone = false;
};

/** A session without a recognizer: every call is answered with one error. */
class StandInModel : public SessionModel {
  public:
    bool isActive() const override { return false; }
    bool isOver() const override { return false; }

    void beginStart(int64_t /*now*/, std::optional<int> /*refusal*/) override {
        expect(Talvox::SpeechError::ErrorNotAvailable);
    }
    std::string endStart() override { return expectAnswered(); }
    void beginStop(int64_t /*now*/) override { expect(Talvox::SpeechError::ErrorNotAvailable); }
    std::string endStop() override { return expectAnswered(); }
    void beginCancel() override { expect(Talvox::SpeechError::ErrorCanceled); }
    std::string endCancel() override { return expectAnswered(); }

    std::string onEvent(Event event, int64_t /*now*/, int errorCode) override {
        const bool isExpected = event == Event::ERROR && expected == errorCode && !isGone();
        expected.reset();
        return isExpected ? "" : nameOf(event, errorCode) + " from a stand-in";
    }
    std::string checkSettled(int64_t /*now*/) override { return ""; }

  private:
    void expect(int errorCode) { expected = errorCode; }
    std::string expectAnswered() const {
        return expected ? "the stand-in did not answer a call" : "";
    }

    std::optional<int> expected;
};

}  // namespace Lifecycle
