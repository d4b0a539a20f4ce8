/**
 * @file
 * Runs of the application that ends in the worst moment.
 */
#pragma once

#include <string>
#include <vector>

#include "Timing.h"
#include "support/ChildProcess.h"

namespace TearDown {

using Words = std::vector<std::string>;

/** One run of it. */
class Application {
  public:
    /** Whether the sanitizers search for what is left at the end. */
    enum class Leaks { IGNORED, SEARCHED };

    /** @param command the program and its arguments */
    explicit Application(const Words& command, Leaks leaks = Leaks::IGNORED);

    /** What starts the application with these words. */
    static Words makeCommand(const Words& words);

    /** Waits until the application is ready for its end. @return false when it ended before */
    bool waitUntilReady();

    /** Waits for the end, which must be clean; adds what was measured. */
    void finish(Timing& timing);

  private:
    bool readMore();

    TestSupport::ChildProcess process;
    std::string output;
};

}  // namespace TearDown
