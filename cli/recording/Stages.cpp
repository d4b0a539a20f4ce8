#include "Stages.h"

#include <algorithm>
#include <optional>

#include "cli/SoundBuffers.h"
#include "cli/endpoint/VadText.h"
#include "core/util/Time.h"
#include "talvox/Settings.h"
#include "talvox/VadAnalysis.h"

namespace Cli {

namespace {

using Json = nlohmann::ordered_json;
using Util::NS_PER_MS;
using Moment = std::optional<int64_t>;

const int BYTES_PER_SAMPLE = 2;

/** The last line of a kind that satisfies a condition. */
template <typename Condition>
const Json* findLast(const Recording& recording, const char* kind, Condition condition) {
    for (auto it = recording.lines.rbegin(); it != recording.lines.rend(); ++it) {
        if (textOf(*it, "kind") == kind && condition(*it)) {
            return &*it;
        }
    }
    return nullptr;
}

const Json* findEvent(const Recording& recording, const std::string& event) {
    return findLast(recording, "event",
                    [&event](const Json& line) { return textOf(line, "event") == event; });
}

Moment timeOf(const Json* line) {
    return line == nullptr ? Moment() : Moment(numberOf(*line, "t"));
}

/** The "vad" setting; empty if it names an engine that there is not, which only a broken file does.
 */
std::string findDetector(const Recording& recording) {
    const Json engine = recording.session.value("engine", Json::object());
    const std::string vad = textOf(engine, Talvox::Settings::SKS_VAD_SETTINGS.c_str());
    const std::string name = parameterValue(vad, "engine");
    const std::string inner = parameterValue(vad, "subengine");
    return (name == "buffered" || name == "wrtc") && inner == "wrtc" ? vad : std::string();
}

/** The end of the last frame of speech in the sound that arrived up to a moment, in samples. */
std::optional<int64_t> findLastSpeech(const Recording& recording, std::size_t heardSamples) {
    if (recording.samples.empty()) {
        return std::nullopt;
    }
    Talvox::VadAnalyzer analyzer(findDetector(recording), recording.sampleRateHz);
    const std::size_t length = bufferLength(recording.sampleRateHz);
    const std::size_t end = std::min(heardSamples, recording.samples.size());
    std::optional<int64_t> last;
    for (std::size_t at = 0; at + length <= end; at += length) {
        const Talvox::VadBufferAnalysis buffer =
            analyzer.analyze(bufferAt(recording.samples, at, length, recording.sampleRateHz));
        for (std::size_t i = 0; i < buffer.decisions.size(); ++i) {
            if (buffer.decisions[i]) {
                last = static_cast<int64_t>(at + (i + 1) * length / buffer.decisions.size());
            }
        }
    }
    return last;
}

/** The end of speech and the arrival of the buffer that it is in. */
struct SpeechEnd {
    int64_t at = 0;
    int64_t arrival = 0;
};

std::optional<SpeechEnd> findSpeechEnd(const Recording& recording, int64_t stop) {
    std::vector<const Json*> buffers;
    int64_t heardBytes = 0;
    for (const Json& line : recording.lines) {
        if (textOf(line, "kind") == "buffer" && numberOf(line, "t") <= stop) {
            buffers.push_back(&line);
            heardBytes = std::max(heardBytes, numberOf(line, "offset") + numberOf(line, "bytes"));
        }
    }
    const std::optional<int64_t> samples =
        findLastSpeech(recording, static_cast<std::size_t>(heardBytes / BYTES_PER_SAMPLE));
    if (!samples) {
        return std::nullopt;
    }
    for (const Json* buffer : buffers) {
        const int64_t end =
            std::min((numberOf(*buffer, "offset") + numberOf(*buffer, "bytes")) / BYTES_PER_SAMPLE,
                     static_cast<int64_t>(recording.samples.size()));
        if (end >= *samples) {
            const int64_t arrival = numberOf(*buffer, "t");
            const int64_t before = (end - *samples) * Util::NS_PER_S / recording.sampleRateHz;
            return SpeechEnd{arrival - before, arrival};
        }
    }
    return std::nullopt;
}

bool isStreamed(const Recording& recording) {
    const Json* attempt = findLast(recording, "attempt", [](const Json&) { return true; });
    return attempt != nullptr && attempt->value("streamed", Json(false)) == Json(true);
}

/** The first piece of the body that leaves from a moment on. */
Moment findNextSent(const Recording& recording, int64_t from) {
    for (const Json& line : recording.lines) {
        if (textOf(line, "kind") == "sent" && numberOf(line, "t") >= from) {
            return numberOf(line, "t");
        }
    }
    return std::nullopt;
}

/** The end of each stage, in the order of `STAGES`, as far as it is known. */
std::array<Moment, STAGES.size()> findEnds(const Recording& recording, const Moment& sent,
                                           int64_t stop, int64_t end) {
    const Json* lastAttempt = findLast(recording, "attempt", [](const Json&) { return true; });
    const int64_t attempt = lastAttempt == nullptr ? 0 : numberOf(*lastAttempt, "attempt");
    const auto isOfAttempt = [attempt](const Json& line) {
        return numberOf(line, "attempt") == attempt;
    };
    const auto any = [](const Json&) { return true; };
    return {sent,
            stop,
            timeOf(findLast(recording, "encoded", any)),
            timeOf(findLast(recording, "connection", isOfAttempt)),
            timeOf(findLast(recording, "sent", isOfAttempt)),
            timeOf(findLast(recording, "attemptEnd", isOfAttempt)),
            end};
}

int64_t toMs(int64_t ns) {
    return ns >= 0 ? (ns + NS_PER_MS / 2) / NS_PER_MS : -((-ns + NS_PER_MS / 2) / NS_PER_MS);
}

}  // namespace

StageTimes measureStages(const Recording& recording) {
    StageTimes times;
    const Json* results = findEvent(recording, "results");
    const Json* error = findEvent(recording, "error");
    const Moment end = timeOf(results != nullptr ? results : error);
    if (!end) {
        times.missing = "the session has neither results nor an error";
        return times;
    }
    const Moment stop = timeOf(findEvent(recording, "recordingDone"));
    if (!stop || *stop > *end) {
        times.missing = results != nullptr ? "the results came before the end of recording"
                                           : "the session ended with an error while it recorded";
        return times;
    }
    const std::optional<SpeechEnd> speech = findSpeechEnd(recording, *stop);
    times.knowsSpeechEnd = speech.has_value();
    const int64_t begin = speech ? std::min(speech->at, *stop) : *stop;
    Moment sent;
    if (speech) {
        sent = isStreamed(recording) ? findNextSent(recording, speech->arrival) : speech->arrival;
        sent = std::min(sent.value_or(speech->arrival), *stop);
    }
    times.beginMs = toMs(begin);
    times.endMs = toMs(*end);
    int64_t before = begin;
    const std::array<Moment, STAGES.size()> ends = findEnds(recording, sent, *stop, *end);
    for (std::size_t i = 0; i < ends.size(); ++i) {
        const int64_t after = std::clamp(ends[i].value_or(before), before, *end);
        // Rounded moments, not rounded differences: so the sum is the total.
        times.ms[i] = toMs(after) - toMs(before);
        before = after;
    }
    return times;
}

}  // namespace Cli
