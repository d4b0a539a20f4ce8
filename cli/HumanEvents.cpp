#include "HumanEvents.h"

#include <algorithm>

#include "JsonEvents.h"
#include "LevelBar.h"
#include "Text.h"
#include "talvox/SpeechError.h"

namespace Cli {

namespace {

const int BAR_WIDTH = 30;
const std::size_t TEXT_COLUMN_MIN = 10;

std::string confidenceText(float confidence) {
    return confidence == Talvox::RecognitionResult::UNKNOWN_CONFIDENCE
               ? "unknown"
               : fixed(static_cast<double>(confidence), 0, 3);
}

}  // namespace

std::string errorText(const SessionEvent& event) {
    const std::string name = Talvox::SpeechError(event.errorCode).getErrorString();
    return event.reason.empty() ? name : name + ": " + printable(event.reason);
}

void HumanEvents::print(const SessionEvent& event) {
    switch (event.kind) {
        case SessionEvent::RECORDING_BEGIN:
            printLine(event.ms, "recording, speak now");
            break;
        case SessionEvent::SPEAKING_BEGIN:
            printLine(event.ms, "speech begins");
            break;
        case SessionEvent::POWER:
            printLevel(event);
            break;
        case SessionEvent::RECORDING_DONE:
            recordingDoneMs = event.ms;
            printLine(event.ms, "recording done, waiting for the answer");
            break;
        case SessionEvent::RESULTS:
            printResults(event);
            break;
        case SessionEvent::FAILURE:
            printLine(event.ms, "error: " + errorText(event));
            break;
    }
    out.flush();
}

void HumanEvents::printLine(int64_t ms, const std::string& text) {
    clearBar();
    out << timeColumn(ms) << text << '\n';
}

void HumanEvents::printLevel(const SessionEvent& event) {
    const std::string bar = "[" + levelBar(event.isSilence ? 0 : event.levelDb, BAR_WIDTH) + "]" +
                            levelText(event.levelDb, event.isSilence);
    if (!terminal) {
        printLine(event.ms, bar);
        return;
    }
    out << '\r' << timeColumn(event.ms) << bar << "\x1b[K";
    barShown = true;
}

void HumanEvents::clearBar() {
    if (barShown) {
        out << "\r\x1b[K";
        barShown = false;
    }
}

void HumanEvents::printTable(const Talvox::RecognitionResults& hypotheses) {
    std::size_t columns = TEXT_COLUMN_MIN;
    for (const Talvox::RecognitionResult& hypothesis : hypotheses) {
        columns = std::max(columns, characterCount(printable(hypothesis.getText())));
    }
    out << "\n  #  " << padded("hypothesis", columns) << "  confidence\n";
    int number = 0;
    for (const Talvox::RecognitionResult& hypothesis : hypotheses) {
        out << fixed(++number, 3, 0) << "  " << padded(printable(hypothesis.getText()), columns)
            << "  " << confidenceText(hypothesis.getConfidence()) << '\n';
    }
    if (hypotheses.empty()) {
        out << "  -  " << padded("(none)", columns) << "  -\n";
    }
}

void HumanEvents::printResults(const SessionEvent& event) {
    const Talvox::Recognition& recognition = *event.recognition;
    printLine(event.ms, recordingDoneMs < 0
                            ? "answer"
                            : "answer, " + std::to_string(event.ms - recordingDoneMs) +
                                  " ms after the end of speech");
    printTable(*recognition.getResults());
    out << '\n'
        << "verdict: " << outcomeName(recognition.getOutcome()) << '\n'
        << "request: " << printable(recognition.getRequestId()) << '\n';
}

}  // namespace Cli
