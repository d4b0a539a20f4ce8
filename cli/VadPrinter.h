#pragma once

#include <string>
#include <vector>

#include "EventPrinter.h"
#include "talvox/VadAnalysis.h"

namespace Cli {

/** Shows what the detector decided: every buffer in order, then the segments once. */
class VadPrinter {
  public:
    virtual ~VadPrinter() = default;
    virtual void printBuffer(const Talvox::VadBufferAnalysis& buffer) = 0;
    /** @param event what a session reports after the buffer that was printed last */
    virtual void printSessionEvent(const SessionEvent& event) = 0;
    /** @param lastIsOpen speech still went on at the end of the sound */
    virtual void printSegments(const std::vector<Talvox::VadSegment>& segments,
                               bool lastIsOpen) = 0;
};

/** The decisions of a buffer's frames as "1" (speech) and "0", in order. */
std::string decisionText(const Talvox::VadBufferAnalysis& buffer);

}  // namespace Cli
