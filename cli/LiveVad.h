#pragma once

#include <ostream>

#include "VadPrinter.h"

namespace Cli {

/** What the live view shows beside the detector's output. */
struct LiveThresholds {
    double activityOn = 0;
    double activityOff = 0;
};

/**
 * One line of a terminal, rewritten with each buffer: time, level over the noise, activity against
 * both thresholds, state, sound that a session would have sent. Events stand above it.
 */
class LiveVad : public VadPrinter {
  public:
    LiveVad(std::ostream& output, LiveThresholds thresholds)
        : out_(output), thresholds_(thresholds) {}
    void printBuffer(const Talvox::VadBufferAnalysis& buffer) override;
    void printSessionEvent(const SessionEvent& event) override;
    void printSegments(const std::vector<Talvox::VadSegment>& segments, bool lastIsOpen) override;

  private:
    std::ostream& out_;
    const LiveThresholds thresholds_;
    float noiseLevel_ = 0;
    int64_t sentMs_ = 0;
    bool isListening_ = true;
};

/**
 * A bar of `width` characters for a share from 0 to 1, with "|" where the share has to be above to
 * begin speech and ":" where it has to be below to end it.
 */
std::string activityBar(double activity, LiveThresholds thresholds, int width);

}  // namespace Cli
