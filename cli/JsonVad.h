#pragma once

#include <ostream>

#include "VadPrinter.h"

namespace Cli {

/**
 * One JSON object a line: {"event":"buffer",...} for each buffer, the events of a session as
 * `JsonEvents` prints them, then {"event":"segment",...}.
 */
class JsonVad : public VadPrinter {
  public:
    explicit JsonVad(std::ostream& output) : out(output) {}
    void printBuffer(const Talvox::VadBufferAnalysis& buffer) override;
    void printSessionEvent(const SessionEvent& event) override;
    void printSegments(const std::vector<Talvox::VadSegment>& segments, bool lastIsOpen) override;

  private:
    std::ostream& out;
};

}  // namespace Cli
