#include "LiveVad.h"

#include <algorithm>
#include <cmath>

#include "HumanVad.h"
#include "LevelBar.h"
#include "Text.h"

namespace Cli {

namespace {

const int BAR_WIDTH = 20;
const char* const CLEAR_LINE = "\r\x1b[K";

std::string secondsText(int64_t ms) {
    return fixed(static_cast<double>(ms) / 1000, 5, 1) + " s";
}

}  // namespace

std::string activityBar(double activity, LiveThresholds thresholds, int width) {
    const auto placeOf = [width](double share) {
        return static_cast<std::size_t>(
            std::lround(std::min(1.0, std::max(0.0, share)) * (width - 1)));
    };
    std::string bar(static_cast<std::size_t>(width), '-');
    if (activity > 0) {
        std::fill_n(bar.begin(), placeOf(activity) + 1, '#');
    }
    bar[placeOf(thresholds.activityOff)] = ':';
    bar[placeOf(thresholds.activityOn)] = '|';
    return bar;
}

void LiveVad::printBuffer(const Talvox::VadBufferAnalysis& buffer) {
    sentMs_ = isListening_ ? buffer.endMs : sentMs_;
    out_ << CLEAR_LINE << secondsText(buffer.endMs) << "  ["
         << levelBar(buffer.isDigitalSilence ? 0 : buffer.level, BAR_WIDTH) << ']'
         << levelText(buffer.level, buffer.isDigitalSilence);
    if (buffer.learningNoise) {
        noiseLevel_ = buffer.level;
        out_ << "  learning the noise";
    } else {
        out_ << ", noise " << fixed(static_cast<double>(noiseLevel_), 0, 1) << "  ["
             << activityBar(static_cast<double>(buffer.activity), thresholds_, BAR_WIDTH) << "] "
             << (buffer.isSpeech ? "speech " : "silence") << "  sent " << secondsText(sentMs_);
    }
    out_ << std::flush;
}

void LiveVad::printSessionEvent(const SessionEvent& event) {
    isListening_ = isListening_ && event.kind != SessionEvent::RECORDING_DONE &&
                   event.kind != SessionEvent::FAILURE;
    out_ << CLEAR_LINE;
    HumanVad(out_, false).printSessionEvent(event);
    if (!isListening_) {
        out_ << "       a session would have sent "
             << fixed(static_cast<double>(sentMs_) / 1000, 0, 1) << " s of sound\n";
    }
}

void LiveVad::printSegments(const std::vector<Talvox::VadSegment>& segments, bool lastIsOpen) {
    out_ << CLEAR_LINE;
    HumanVad(out_, false).printSegments(segments, lastIsOpen);
}

}  // namespace Cli
