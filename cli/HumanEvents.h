#pragma once

#include <cstdint>
#include <ostream>
#include <string>

#include "EventPrinter.h"

namespace Cli {

/** The name of a FAILURE and its reason. */
std::string errorText(const SessionEvent& event);

/**
 * Prints a session for a reader: the events with a level bar, then the table of hypotheses, the
 * verdict and how long the answer took. On a terminal the bar is redrawn in place; anywhere else
 * every event is a line of its own and no control character is written.
 */
class HumanEvents : public EventPrinter {
  public:
    HumanEvents(std::ostream& output, bool isTerminal) : out(output), terminal(isTerminal) {}
    void print(const SessionEvent& event) override;

  private:
    void printLine(int64_t ms, const std::string& text);
    void printLevel(const SessionEvent& event);
    void printResults(const SessionEvent& event);
    void printTable(const Talvox::RecognitionResults& hypotheses);
    void clearBar();

    std::ostream& out;
    const bool terminal;
    bool barShown = false;
    int64_t recordingDoneMs = -1;
};

}  // namespace Cli
