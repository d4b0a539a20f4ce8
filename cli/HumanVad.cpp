#include "HumanVad.h"

#include <cmath>

#include "LevelBar.h"
#include "Text.h"

namespace Cli {

namespace {

const int BAR_WIDTH = 20;
const std::size_t STATE_COLUMNS = 8;

const char* stateName(const Talvox::VadBufferAnalysis& buffer) {
    if (buffer.learningNoise) {
        return "noise";
    }
    return buffer.isSpeech ? "speech" : "silence";
}

std::string activityText(const Talvox::VadBufferAnalysis& buffer) {
    if (buffer.learningNoise || std::isnan(buffer.activity)) {
        return "    -";
    }
    return fixed(static_cast<double>(buffer.activity), 5, 3);
}

}  // namespace

void HumanVad::printBuffer(const Talvox::VadBufferAnalysis& buffer) {
    if (!headerPrinted) {
        out << "    from  level" << std::string(BAR_WIDTH + 8, ' ')
            << "activity  state   frames (1 speech, 0 none)\n";
        headerPrinted = true;
    }
    out << timeColumn(buffer.startMs) << '[' << levelBar(buffer.level, BAR_WIDTH) << ']'
        << fixed(static_cast<double>(buffer.level), 6, 1) << " dB"
        << "   " << activityText(buffer) << "  " << padded(stateName(buffer), STATE_COLUMNS)
        << decisionText(buffer) << '\n';
}

void HumanVad::printSegments(const std::vector<Talvox::VadSegment>& segments, bool lastIsOpen) {
    out << "\nsegments of speech:" << (segments.empty() ? " none" : "") << '\n';
    for (const Talvox::VadSegment& segment : segments) {
        out << timeColumn(segment.startMs) << "to" << timeColumn(segment.endMs) << '('
            << segment.endMs - segment.startMs << " ms)"
            << (lastIsOpen && &segment == &segments.back() ? ", not ended with the sound" : "")
            << '\n';
    }
}

}  // namespace Cli
