#pragma once

#include <ostream>

#include "VadPrinter.h"

namespace Cli {

/** A table with one line for each buffer, then the list of segments. */
class HumanVad : public VadPrinter {
  public:
    /** @param isGeneralMode levels are relative to the leading noise */
    HumanVad(std::ostream& output, bool isGeneralMode) : out(output), isGeneral(isGeneralMode) {}
    void printBuffer(const Talvox::VadBufferAnalysis& buffer) override;
    void printSessionEvent(const SessionEvent& event) override;
    void printSegments(const std::vector<Talvox::VadSegment>& segments, bool lastIsOpen) override;

  private:
    std::ostream& out;
    const bool isGeneral;
    bool headerPrinted = false;
};

}  // namespace Cli
