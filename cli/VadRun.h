#pragma once

#include <vector>

#include "VadPrinter.h"

namespace Cli {

/** Hands what the detector decides to printers, and knows whether a session would still listen. */
class VadRun {
  public:
    /**
     * @param printer     gets every buffer
     * @param showsEvents whether it gets what a session reports as well
     * @param report      gets both; may be null
     */
    VadRun(VadPrinter& printer, bool showsEvents, VadPrinter* report)
        : printer_(printer), showsEvents_(showsEvents), report_(report) {}

    void show(const Talvox::VadBufferAnalysis& analysis);

    /** @param segments all speech of the sound */
    void finish(const std::vector<Talvox::VadSegment>& segments);

    /** False once a session has stopped listening. */
    bool isListening() const { return isListening_; }

  private:
    VadPrinter& printer_;
    const bool showsEvents_;
    VadPrinter* const report_;
    bool isSpeech_ = false;
    bool isListening_ = true;
};

}  // namespace Cli
