#pragma once

#include <ostream>

#include "VadPrinter.h"

namespace Cli {

/** One JSON object a line: {"event":"buffer",...} for each buffer, then {"event":"segment",...}. */
class JsonVad : public VadPrinter {
  public:
    explicit JsonVad(std::ostream& output) : out(output) {}
    void printBuffer(const Talvox::VadBufferAnalysis& buffer) override;
    void printSegments(const std::vector<Talvox::VadSegment>& segments, bool lastIsOpen) override;

  private:
    std::ostream& out;
};

}  // namespace Cli
