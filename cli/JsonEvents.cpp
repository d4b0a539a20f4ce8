#include "JsonEvents.h"

#include <charconv>
#include <cmath>
#include <cstdlib>

#include "talvox/SpeechError.h"

namespace Cli {

namespace {

const char* eventName(SessionEvent::Kind kind) {
    switch (kind) {
        case SessionEvent::RECORDING_BEGIN:
            return "recordingBegin";
        case SessionEvent::SPEAKING_BEGIN:
            return "speakingBegin";
        case SessionEvent::POWER:
            return "power";
        case SessionEvent::RECORDING_DONE:
            return "recordingDone";
        case SessionEvent::RESULTS:
            return "results";
        case SessionEvent::FAILURE:
            return "error";
    }
    return "unknown";
}

Json hypotheses(const Talvox::Recognition& recognition) {
    Json list = Json::array();
    for (const Talvox::RecognitionResult& result : *recognition.getResults()) {
        Json entry;
        entry["text"] = result.getText();
        entry["confidence"] = toJsonNumber(result.getConfidence());
        list.push_back(entry);
    }
    return list;
}

}  // namespace

Json toJsonNumber(float value) {
    if (!std::isfinite(value)) {
        return nullptr;
    }
    char text[64];
    const std::to_chars_result end = std::to_chars(text, text + sizeof text - 1, value);
    *end.ptr = '\0';
    return std::strtod(text, nullptr);
}

std::string toJsonLine(const Json& value) {
    return value.dump(-1, ' ', false, Json::error_handler_t::replace);
}

const char* outcomeName(Talvox::Recognition::Outcome outcome) {
    switch (outcome) {
        case Talvox::Recognition::OutcomeRejected:
            return "rejected";
        case Talvox::Recognition::OutcomeAccepted:
            return "accepted";
        case Talvox::Recognition::OutcomeUncertain:
            return "uncertain";
    }
    return "unknown";
}

void JsonEvents::print(const SessionEvent& event) {
    Json object;
    object["event"] = eventName(event.kind);
    object["ms"] = event.ms;
    if (event.kind == SessionEvent::POWER) {
        object["level"] = toJsonNumber(event.levelDb);
        object["silence"] = event.isSilence;
    } else if (event.kind == SessionEvent::FAILURE) {
        object["code"] = event.errorCode;
        object["name"] = Talvox::SpeechError(event.errorCode).getErrorString();
        if (!event.reason.empty()) {
            object["reason"] = event.reason;
        }
    } else if (event.kind == SessionEvent::RESULTS) {
        object["outcome"] = outcomeName(event.recognition->getOutcome());
        object["outcomeCode"] = static_cast<int>(event.recognition->getOutcome());
        object["requestId"] = event.recognition->getRequestId();
        object["hypotheses"] = hypotheses(*event.recognition);
    }
    out << toJsonLine(object) << std::endl;
}

}  // namespace Cli
