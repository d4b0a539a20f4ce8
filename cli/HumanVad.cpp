#include "HumanVad.h"

#include <cmath>

#include "LevelBar.h"
#include "Text.h"
#include "talvox/SpeechError.h"

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

std::string sessionText(const SessionEvent& event) {
    switch (event.kind) {
        case SessionEvent::RECORDING_BEGIN:
            return "recording begins";
        case SessionEvent::SPEAKING_BEGIN:
            return "speech begins";
        case SessionEvent::RECORDING_DONE:
            return "recording is done";
        default:
            return std::string("error: ") + Talvox::SpeechError(event.errorCode).getErrorString();
    }
}

}  // namespace

void HumanVad::printBuffer(const Talvox::VadBufferAnalysis& buffer) {
    if (!headerPrinted) {
        out << "level: " << levelReference(isGeneral)
            << ", smoothed; of the noise: dB above -45.3 dBFS, summed up\n\n";
        out << "    from  level" << std::string(BAR_WIDTH + 8, ' ')
            << "activity  state   frames (1 speech, 0 none)\n";
        headerPrinted = true;
    }
    out << timeColumn(buffer.startMs) << '['
        << levelBar(buffer.isDigitalSilence ? 0 : buffer.level, BAR_WIDTH) << ']'
        << levelText(buffer.level, buffer.isDigitalSilence) << "   " << activityText(buffer) << "  "
        << padded(stateName(buffer), STATE_COLUMNS) << decisionText(buffer) << '\n';
}

void HumanVad::printSessionEvent(const SessionEvent& event) {
    out << "       -> session, after " << event.ms << " ms: " << sessionText(event) << '\n';
}

void HumanVad::printSegments(const std::vector<Talvox::VadSegment>& segments, bool lastIsOpen) {
    out << "\nsegments of speech:" << (segments.empty() ? " none" : "") << '\n';
    for (const Talvox::VadSegment& segment : segments) {
        out << timeColumn(segment.startMs) << "to" << timeColumn(segment.endMs) << '('
            << segment.endMs - segment.startMs << " ms)"
            << (lastIsOpen && &segment == &segments.back() ? ", still open at the end of the sound"
                                                           : "")
            << '\n';
    }
}

}  // namespace Cli
