#include "EventComparison.h"

#include <cmath>
#include <cstdio>
#include <utility>

#include "pal/kd_time.h"
#include "talvox/SpeechError.h"

namespace Cli {

namespace {

using nlohmann::json;
using Talvox::ObservedEvent;

/** Decibels; compilers and C libraries differ in the last digits. */
constexpr float LEVEL_TOLERANCE_DB = 0.01F;

const char* nameOf(ObservedEvent::Kind kind) {
    switch (kind) {
        case ObservedEvent::RECORDING_BEGIN:
            return "recordingBegin";
        case ObservedEvent::SPEAKING_BEGIN:
            return "speakingBegin";
        case ObservedEvent::RECORDING_DONE:
            return "recordingDone";
        case ObservedEvent::BUFFER_RECEIVED:
            return "buffer";
        case ObservedEvent::POWER_CHANGED:
            return "power";
        case ObservedEvent::RESULTS:
            return "results";
        case ObservedEvent::ERROR:
            return "error";
    }
    return "";
}

const char* nameOf(Talvox::Recognition::Outcome outcome) {
    switch (outcome) {
        case Talvox::Recognition::OutcomeRejected:
            return "rejected";
        case Talvox::Recognition::OutcomeAccepted:
            return "accepted";
        case Talvox::Recognition::OutcomeUncertain:
            return "uncertain";
    }
    return "";
}

json toJson(const ObservedEvent& event) {
    json fields = {{"event", nameOf(event.kind)}};
    if (event.kind == ObservedEvent::POWER_CHANGED) {
        fields["level"] = std::isfinite(event.levelDb) ? json(event.levelDb) : json();
    } else if (event.kind == ObservedEvent::ERROR) {
        fields["name"] = Talvox::SpeechError(event.errorCode).getErrorString();
        fields["reason"] = std::string(event.reason);
    } else if (event.kind == ObservedEvent::RESULTS) {
        fields["outcome"] = nameOf(event.recognition->getOutcome());
        fields["requestId"] = event.recognition->getRequestId();
        fields["hypotheses"] = json::array();
        for (const Talvox::RecognitionResult& result : *event.recognition->getResults()) {
            fields["hypotheses"].push_back(result.getText());
        }
    }
    return fields;
}

/** What of a recorded line is compared. */
json chooseFields(const json& line) {
    json fields;
    for (const char* const name : {"event", "level", "name", "reason", "outcome", "requestId"}) {
        if (line.contains(name)) {
            fields[name] = line[name];
        }
    }
    if (line.contains("hypotheses")) {
        fields["hypotheses"] = json::array();
        for (const json& hypothesis : line["hypotheses"]) {
            fields["hypotheses"].push_back(hypothesis.value("text", ""));
        }
    }
    return fields;
}

bool isEqual(json one, json other) {
    const json left = one.value("level", json());
    const json right = other.value("level", json());
    if (left.is_number() && right.is_number()) {
        one.erase("level");
        other.erase("level");
        return one == other &&
               std::abs(left.get<float>() - right.get<float>()) <= LEVEL_TOLERANCE_DB;
    }
    return one == other;
}

std::string describe(const json& fields) {
    std::string text = fields.value("event", "");
    for (const auto& [name, value] : fields.items()) {
        if (name != "event") {
            text += " " + name + "=" + value.dump(-1, ' ', false, json::error_handler_t::replace);
        }
    }
    return text;
}

std::string describeTime(int64_t nanoseconds) {
    char text[64];
    std::snprintf(text, sizeof text, "%.3f ms", static_cast<double>(nanoseconds) / 1e6);
    return text;
}

}  // namespace

EventComparison::EventComparison(std::vector<json> recorded, int64_t zeroTime,
                                 int64_t mostLatenessNs)
    : expected(std::move(recorded)), zero(zeroTime), mostLateness(mostLatenessNs) {}

std::string EventComparison::getDifference() const {
    const std::lock_guard<std::mutex> lock(mutex);
    if (failure) {
        std::rethrow_exception(failure);
    }
    return firstDifference;
}

void EventComparison::note(const std::string& difference) {
    if (firstDifference.empty()) {
        firstDifference = difference;
    }
}

void EventComparison::expectEvents(std::size_t wanted) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (count < wanted) {
        const json& line = expected[count];
        note("event " + std::to_string(count) + " does not come; recorded: " +
             describe(chooseFields(line)) + " at " + describeTime(line.value("t", int64_t{0})));
    }
}

void EventComparison::waitForWorkers() {
    std::unique_lock<std::mutex> lock(mutex);
    changed.wait(lock, [this] { return isOver || pendingBuffers == 0; });
}

void EventComparison::onCall(Call call) noexcept {
    const std::lock_guard<std::mutex> lock(mutex);
    isOver = isOver || call == Call::RELEASE;
    changed.notify_all();
}

void EventComparison::onEncoding() noexcept {
    const std::lock_guard<std::mutex> lock(mutex);
    ++pendingBuffers;
}

void EventComparison::onEncoded(std::size_t /*size*/, bool isLast) noexcept {
    const std::lock_guard<std::mutex> lock(mutex);
    pendingBuffers -= isLast ? 0 : 1;
    changed.notify_all();
}

void EventComparison::onEventBegin(const ObservedEvent& event) noexcept {
    const std::lock_guard<std::mutex> lock(mutex);
    try {
        openEvents.push_back(static_cast<int>(count));
        compare(event);
    } catch (...) {
        failure = std::current_exception();
    }
    ++count;
    isOver = isOver || event.kind == ObservedEvent::RESULTS || event.kind == ObservedEvent::ERROR;
    changed.notify_all();
}

void EventComparison::onEventEnd() noexcept {
    openEvents.pop_back();
}

void EventComparison::compare(const ObservedEvent& event) {
    const json actual = toJson(event);
    const int64_t time = kdGetTimeUST() - zero;
    const std::string what =
        "event " + std::to_string(count) + " is " + describe(actual) + " at " + describeTime(time);
    if (count >= expected.size()) {
        note(what + "; nothing more was recorded");
        return;
    }
    const json recorded = chooseFields(expected[count]);
    const auto recordedTime = expected[count].value("t", int64_t{0});
    const int64_t lateness = recordedTime - time;
    if (!isEqual(actual, recorded) || lateness < 0 || lateness > mostLateness) {
        note(what + "; recorded: " + describe(recorded) + " at " + describeTime(recordedTime));
    }
}

}  // namespace Cli
