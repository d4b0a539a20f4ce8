#pragma once

#include <cstdint>
#include <sstream>
#include <string>
#include <vector>

#include "cli/JsonVad.h"
#include "cli/VadPrinter.h"

namespace Cli {

/** What a report on one sound shows besides the detector's output. */
struct VadReportInput {
    std::string file; /**< as given */
    std::string vad;
    int rateHz = 0;
    const std::vector<int16_t>* samples = nullptr; /**< not null */
};

/** Collects what the detector decides, as `JsonVad` prints it, for a report. */
class VadReport : public VadPrinter {
  public:
    VadReport() : lines_(text_) {}
    void printBuffer(const Talvox::VadBufferAnalysis& buffer) override;
    void printSessionEvent(const SessionEvent& event) override;
    void printSegments(const std::vector<Talvox::VadSegment>& segments, bool lastIsOpen) override;

    /**
     * Writes the page. Labels are those of a label file beside the sound, if there is a sound one.
     * @throws UsageError if the file cannot be written
     */
    void write(const std::string& path, const VadReportInput& input) const;

  private:
    std::stringstream text_;
    JsonVad lines_;
};

}  // namespace Cli
