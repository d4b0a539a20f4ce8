#include "JsonVad.h"

#include "JsonEvents.h"

namespace Cli {

void JsonVad::printBuffer(const Talvox::VadBufferAnalysis& buffer) {
    Json object;
    object["event"] = "buffer";
    object["startMs"] = buffer.startMs;
    object["endMs"] = buffer.endMs;
    object["learningNoise"] = buffer.learningNoise;
    object["level"] = toJsonNumber(buffer.level);
    object["silence"] = buffer.isDigitalSilence;
    object["frames"] = decisionText(buffer);
    object["activity"] = toJsonNumber(buffer.activity);
    object["speech"] = buffer.isSpeech;
    out << toJsonLine(object) << '\n';
}

void JsonVad::printSessionEvent(const SessionEvent& event) {
    JsonEvents(out).print(event);
}

void JsonVad::printSegments(const std::vector<Talvox::VadSegment>& segments, bool lastIsOpen) {
    for (const Talvox::VadSegment& segment : segments) {
        Json object;
        object["event"] = "segment";
        object["startMs"] = segment.startMs;
        object["endMs"] = segment.endMs;
        object["ended"] = !(lastIsOpen && &segment == &segments.back());
        out << toJsonLine(object) << '\n';
    }
}

}  // namespace Cli
