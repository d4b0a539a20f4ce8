#include "VadRun.h"

#include <optional>

#include "talvox/SpeechError.h"

namespace Cli {

namespace {

/** What a session reports by the step; nothing when it goes on listening. */
std::optional<SessionEvent> toSessionEvent(const Talvox::VadBufferAnalysis& buffer) {
    SessionEvent event;
    event.ms = buffer.arrivalMs;
    switch (buffer.step) {
        case Talvox::ListeningStep::GO_ON:
            return std::nullopt;
        case Talvox::ListeningStep::RECORDING_BEGINS:
            event.kind = SessionEvent::RECORDING_BEGIN;
            break;
        case Talvox::ListeningStep::SPEECH_BEGINS:
            event.kind = SessionEvent::SPEAKING_BEGIN;
            break;
        case Talvox::ListeningStep::LISTENING_ENDS:
            event.kind = SessionEvent::RECORDING_DONE;
            break;
        case Talvox::ListeningStep::NO_VOICE:
            event.kind = SessionEvent::FAILURE;
            event.errorCode = Talvox::SpeechError::ErrorNoVoice;
            break;
    }
    return event;
}

bool endsListening(Talvox::ListeningStep step) {
    return step == Talvox::ListeningStep::LISTENING_ENDS || step == Talvox::ListeningStep::NO_VOICE;
}

}  // namespace

void VadRun::show(const Talvox::VadBufferAnalysis& analysis) {
    const std::optional<SessionEvent> event =
        isListening_ ? toSessionEvent(analysis) : std::nullopt;
    printer_.printBuffer(analysis);
    if (event && showsEvents_) {
        printer_.printSessionEvent(*event);
    }
    if (report_ != nullptr) {
        report_->printBuffer(analysis);
        if (event) {
            report_->printSessionEvent(*event);
        }
    }
    isSpeech_ = analysis.isSpeech;
    isListening_ = isListening_ && !endsListening(analysis.step);
}

void VadRun::finish(const std::vector<Talvox::VadSegment>& segments) {
    printer_.printSegments(segments, isSpeech_);
    if (report_ != nullptr) {
        report_->printSegments(segments, isSpeech_);
    }
}

}  // namespace Cli
