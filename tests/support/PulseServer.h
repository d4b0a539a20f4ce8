/**
 * @file
 * A sound server of the test's own, without a sound card.
 */
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "support/ChildProcess.h"
#include "support/ScratchDirectory.h"

namespace TestSupport {

/**
 * Makes the sound client library of this process look for its server at an address, in an
 * environment without any settings of the user. Restores the environment when it goes. To be made
 * and destroyed while no recorder exists.
 */
class PulseEnvironment {
  public:
    PulseEnvironment(const ScratchDirectory& home, const std::string& serverAddress);
    ~PulseEnvironment();
    PulseEnvironment(const PulseEnvironment&) = delete;
    PulseEnvironment& operator=(const PulseEnvironment&) = delete;

    /** The variables that are set, for other programs. */
    const ChildProcess::Environment& getVariables() const { return variables; }

  private:
    ChildProcess::Environment variables;
    std::vector<std::pair<std::string, std::unique_ptr<std::string>>> before;
};

/**
 * A PulseAudio server at 16 kHz mono whose default source records, bit by bit, what is played to
 * it, and zeros while nothing is.
 */
class PulseServer {
  public:
    /** Starts the server and waits until it is ready, which may fail: see `isRunning`. */
    PulseServer();
    ~PulseServer();

    /** False when the server cannot be had here; tests then skip. */
    bool isRunning() const { return running; }

    /** What the server said, for the reason of a skip. */
    const std::string& getOutput() const { return output; }

    /** Plays 16 kHz mono samples into the microphone; returns when they were played. */
    bool play(const std::vector<int16_t>& samples);

    /** Runs a command of `pactl` and returns what it printed. */
    ChildProcess::Result control(const std::vector<std::string>& arguments);

    /** Kills the server at once. */
    void kill();

    /** Stops the server without ending it: it keeps its connections and says nothing. */
    void freeze();

    /** Lets a frozen server go on. */
    void thaw();

  private:
    void drain();

    ScratchDirectory directory;
    PulseEnvironment environment;
    std::unique_ptr<ChildProcess> process;
    std::string output;
    bool running = false;
    std::thread drainer;
};

}  // namespace TestSupport
