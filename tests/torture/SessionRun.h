/**
 * @file
 * One canonical session from its settings to its release.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <functional>
#include <string>

#include "Order.h"
#include "OutcomeListener.h"
#include "Plan.h"
#include "PushedRecorder.h"
#include "talvox/Recognizer.h"
#include "talvox/Settings.h"
#include "talvox/Talvox.h"

namespace Torture {

/**
 * Runs a session on the platform clock, which it moves: sound, calls and time as the plan says, and
 * then as much time as the documented limits allow, until the session ends. To be used on one
 * thread, which counts as a `Harness` but inside the engine's calls.
 */
class SessionRun {
  public:
    /** Whose turn it is: the session in which a call fails, or a sound one. */
    enum class Turn { FIRST, NEXT };

    SessionRun(const Plan& plan, const Order& order, Turn turn, SessionOutcome& outcome);
    ~SessionRun();
    SessionRun(const SessionRun&) = delete;
    SessionRun& operator=(const SessionRun&) = delete;

    /** Returns when the session is over and released, or its time is. */
    void run();

  private:
    void call(const char* name, const std::function<void()>& function);
    bool findEngine();
    void configure();
    void chooseRecorder();
    void create();
    void log();
    void play();
    void playPushed(int buffers);
    void playPaced(int buffers);
    void awaitCapture(int buffers);
    void push();
    void advance(std::int64_t ms);
    void interfere();
    void awaitEnd();
    void release();

    const Plan& plan;
    const Order& order;
    const Turn turn;
    SessionOutcome& outcome;
    const boost::shared_ptr<OutcomeListener> listener;
    Talvox::Talvox* engine = nullptr;
    boost::shared_ptr<Talvox::Settings> engineSettings;
    boost::shared_ptr<Talvox::Settings> ownSettings;
    boost::shared_ptr<Talvox::Recognizer> session;
    boost::shared_ptr<PushedRecorder> recorder;
    std::string bytes;
};

}  // namespace Torture
