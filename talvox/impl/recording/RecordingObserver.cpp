#include "talvox/impl/recording/RecordingObserver.h"

#include <boost/make_shared.hpp>
#include <exception>
#include <optional>
#include <utility>

#include "core/network/NetworkManager.h"
#include "pal/kd.h"
#include "talvox/Talvox.h"
#include "talvox/impl/recording/SettingsJson.h"

namespace Talvox {

namespace {

constexpr int FORMAT_VERSION = 1;
constexpr const char* HEADERS[] = {"x-asrgw-recognition-results", "x-kvrequestid", "content-type",
                                   "server", "x-asrgw-arrivals"};

const char* nameOf(SessionObserver::Call call) {
    switch (call) {
        case SessionObserver::Call::START:
            return "start";
        case SessionObserver::Call::STOP:
            return "stop";
        case SessionObserver::Call::CANCEL:
            return "cancel";
        case SessionObserver::Call::RELEASE:
            return "release";
    }
    return "";
}

const char* nameOf(SessionObserver::RecorderCall call) {
    switch (call) {
        case SessionObserver::RecorderCall::INIT:
            return "init";
        case SessionObserver::RecorderCall::START:
            return "start";
        case SessionObserver::RecorderCall::STOP:
            return "stop";
    }
    return "";
}

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

const char* nameOf(Recognition::Outcome outcome) {
    switch (outcome) {
        case Recognition::OutcomeRejected:
            return "rejected";
        case Recognition::OutcomeAccepted:
            return "accepted";
        case Recognition::OutcomeUncertain:
            return "uncertain";
    }
    return "";
}

std::string makeCalendarText(KDtime seconds) {
    KDTm utc = {};
    kdGmtime_r(&seconds, &utc);
    char text[64];
    kdSprintf_s(text, sizeof text, "%04d-%02d-%02dT%02d:%02d:%02dZ", utc.tm_year + 1900,
                utc.tm_mon + 1, utc.tm_mday, utc.tm_hour, utc.tm_min, utc.tm_sec);
    return text;
}

std::string makeDescription(const SessionRecordingOptions& options, const Settings& engineSettings,
                            const Recognizer& recognizer, KDtime now) {
    JsonObject object;
    object.add("format", FORMAT_VERSION)
        .addText("kit", Talvox::VERSION)
        .addText("time", makeCalendarText(now))
        .addText("source", options.source)
        .add("sampleRate", engineSettings.getSampleRate())
        .addBoolean("hasSound", options.hasSound)
        .add("reachability", Network::NetworkManager::getInstance().getReachability())
        .addJson("engine", makeSettingsJson(engineSettings))
        .addJson("recognizer", makeSettingsJson(*recognizer.getSettings()));
    return object.getText() + "\n";
}

std::string makeHypotheses(const RecognitionResults& results) {
    std::string list = "[";
    for (const RecognitionResult& result : results) {
        JsonObject hypothesis;
        hypothesis.addText("text", result.getText());
        hypothesis.addNumber("confidence", result.getConfidence());
        list += (list.size() > 1 ? "," : "") + hypothesis.getText();
    }
    return list + "]";
}

/** Whether a buffer is what the session asks its recorder for. */
bool isUsual(const Sound::SoundDataInfo& format, int sampleRate) {
    return format.getCodec() == Sound::SoundDataInfo::NONE && format.getChannelCount() == 1 &&
           format.getSampleRate() == sampleRate && format.getSampleSize() == 2;
}

std::string makeFormat(const Sound::SoundDataInfo& format) {
    return "[" + std::to_string(format.getCodec()) + "," +
           std::to_string(format.getChannelCount()) + "," + std::to_string(format.getSampleRate()) +
           "," + std::to_string(format.getSampleSize()) + "]";
}

void addStage(JsonObject& line, const char* name, int64_t time) {
    if (time != Network::TransferConnection::NONE) {
        line.add(name, time);
    }
}

}  // namespace

RecordingObserver::RecordingObserver(boost::shared_ptr<RecordingWriter> recordingWriter,
                                     const SessionRecordingOptions& options,
                                     const Recognizer& recognizer)
    : writer(std::move(recordingWriter)),
      hasSound(options.hasSound),
      engine(*recognizer.getEngine()),
      beginning(kdGetTimeUST()),
      engineSettings(engine.getTalvoxSettings()),
      files(boost::make_shared<RecordingFiles>(hasSound ? engineSettings->getSampleRate() : 0)) {
    const KDtime now = kdTime(nullptr);
    writer->open(files, now, makeDescription(options, *engineSettings, recognizer, now));
}

RecordingObserver::~RecordingObserver() {
    record([this] { finish("released"); });
}

// What cannot be recorded for want of memory ends the recording, never the session.
template <typename Write>
void RecordingObserver::record(Write write) noexcept {
    if (files->isBroken()) {
        return;
    }
    try {
        write();
    } catch (const std::exception& exception) {
        kdLogFormatMessage("SessionRecording: the recording ends: %s", exception.what());
        files->breakOff();
    }
}

JsonObject RecordingObserver::makeLine(const char* kind) const {
    return makeLineAt(kdGetTimeUST(), kind);
}

JsonObject RecordingObserver::makeLineAt(int64_t time, const char* kind) const {
    JsonObject line;
    line.add("t", time - beginning).addText("kind", kind);
    return line;
}

void RecordingObserver::put(const JsonObject& line, bool isUrgent) const {
    writer->writeLine(files, line.getText(), isUrgent);
}

void RecordingObserver::finish(const char* reason) {
    if (!isFinished) {
        isFinished = true;
        writer->close(files, reason, kdGetTimeUST() - beginning);
        files->breakOff();
    }
}

void RecordingObserver::onCall(Call call) noexcept {
    record([this, call] {
        JsonObject line = makeLine("call");
        line.addText("call", nameOf(call));
        if (!openEvents.empty()) {
            line.add("in", openEvents.back());
        }
        put(line);
        if (call == Call::RELEASE) {
            finish("released");
        }
    });
}

void RecordingObserver::onRecorderCall(RecorderCall call) noexcept {
    record([this, call] {
        recorderCalls.push_back(nameOf(call));
        JsonObject line = makeLine("recorder");
        put(line.addText("does", nameOf(call)));
    });
}

void RecordingObserver::onRecorderReturned(RecorderCall call, bool worked) noexcept {
    record([this, call, worked] {
        recorderCalls.pop_back();
        if (call == RecorderCall::INIT) {
            JsonObject line = makeLine("recorder");
            put(line.addText("did", nameOf(call)).addBoolean("works", worked));
        }
    });
}

void RecordingObserver::onStarted(int64_t startTime, bool isStreaming) noexcept {
    record([=] {
        JsonObject line = makeLineAt(startTime, "started");
        put(line.addBoolean("streaming", isStreaming));
    });
}

void RecordingObserver::onBuffer(int64_t arrival, const Sound::SoundDataBuffer& buffer) noexcept {
    record([&] {
        const std::vector<unsigned char>& bytes = buffer.getData();
        JsonObject line = makeLineAt(arrival, "buffer");
        line.add("n", bufferCount++)
            .add("offset", soundBytes)
            .add("bytes", static_cast<int64_t>(bytes.size()))
            .add("samples", buffer.getInfo().getSampleCount());
        if (!isUsual(buffer.getInfo(), engineSettings->getSampleRate())) {
            line.addJson("format", makeFormat(buffer.getInfo()));
        }
        soundBytes += static_cast<int64_t>(bytes.size());
        if (hasSound) {
            writer->writeSound(files, bytes.data(), bytes.size());
        }
        put(line);
    });
}

void RecordingObserver::onRecorderError() noexcept {
    record([this] {
        JsonObject line = makeLine("recorderError");
        if (!recorderCalls.empty()) {
            line.addText("in", recorderCalls.back());
        }
        put(line);
    });
}

void RecordingObserver::onNoise(float levelDb, int row) noexcept {
    record([=] {
        JsonObject line = makeLine("noise");
        put(line.addNumber("level", levelDb).add("row", row), false);
    });
}

void RecordingObserver::onDetector(bool isSpeech, float activity) noexcept {
    record([=] {
        JsonObject line = makeLine("detector");
        put(line.addBoolean("speech", isSpeech).addNumber("activity", activity), false);
    });
}

void RecordingObserver::onEncoded(std::size_t size, bool isLast) noexcept {
    record([=] {
        if (size > 0 || isLast) {
            JsonObject line = makeLine("encoded");
            put(line.add("bytes", static_cast<int64_t>(size)).addBoolean("last", isLast), false);
        }
    });
}

void RecordingObserver::onAttempt(int attempt, const Network::HttpRequest& request) noexcept {
    record([&] {
        JsonObject line = makeLine("attempt");
        line.add("attempt", attempt).addBoolean("streamed", request.isChunked());
        if (!request.isChunked()) {
            line.add("bytes", static_cast<int64_t>(request.getBody().size()));
        }
        put(line);
    });
}

void RecordingObserver::onConnection(int attempt,
                                     const Network::TransferConnection& connection) noexcept {
    record([&] {
        JsonObject line = makeLine("connection");
        line.add("attempt", attempt).addBoolean("new", connection.isNew);
        addStage(line, "lookup", connection.lookupNs);
        addStage(line, "connected", connection.connectedNs);
        addStage(line, "tls", connection.tlsNs);
        put(line);
    });
}

void RecordingObserver::onSent(int attempt, std::size_t size) noexcept {
    record([=] {
        JsonObject line = makeLine("sent");
        put(line.add("attempt", attempt).add("bytes", static_cast<int64_t>(size)), false);
    });
}

void RecordingObserver::onHead(int attempt, const Network::HttpResponse& response) noexcept {
    record([&] {
        JsonObject headers;
        for (const char* const name : HEADERS) {
            if (const std::optional<std::string> value = response.getHeader(name)) {
                headers.addText(name, *value);
            }
        }
        JsonObject line = makeLine("head");
        line.add("attempt", attempt)
            .add("status", response.getStatus())
            .addJson("headers", headers.getText());
        put(line);
    });
}

void RecordingObserver::onBody(int attempt, std::size_t size) noexcept {
    record([=] {
        JsonObject line = makeLine("body");
        put(line.add("attempt", attempt).add("bytes", static_cast<int64_t>(size)));
    });
}

void RecordingObserver::onAttemptEnd(int attempt, const Network::TransferEnd& how) noexcept {
    record([&] {
        JsonObject line = makeLine("attemptEnd");
        put(line.add("attempt", attempt).add("code", how.code).addText("reason", how.reason));
    });
}

void RecordingObserver::onFinished(int code) noexcept {
    record([=] {
        JsonObject line = makeLine("finished");
        put(line.add("code", code));
    });
}

// Of all that a session reads of the engine's settings, only the thresholds for its results are
// read after its beginning.
void RecordingObserver::noteSettings() {
    const boost::shared_ptr<const Settings> current = engine.getTalvoxSettings();
    if (current != engineSettings) {
        engineSettings = current;
        JsonObject line = makeLine("settings");
        put(line.addJson("engine", makeSettingsJson(*current)));
    }
}

void RecordingObserver::onEventBegin(const ObservedEvent& event) noexcept {
    record([&] {
        if (event.kind == ObservedEvent::RESULTS) {
            noteSettings();
        }
        const bool isTerminal =
            event.kind == ObservedEvent::RESULTS || event.kind == ObservedEvent::ERROR;
        JsonObject line = makeLine("event");
        line.add("n", eventCount).addText("event", nameOf(event.kind));
        if (event.kind == ObservedEvent::BUFFER_RECEIVED) {
            line.add("buffer", bufferCount - 1);
        } else if (event.kind == ObservedEvent::POWER_CHANGED) {
            line.addNumber("level", event.levelDb);
        } else if (event.kind == ObservedEvent::ERROR) {
            line.add("code", event.errorCode)
                .addText("name", SpeechError(event.errorCode).getErrorString())
                .addText("reason", event.reason);
        } else if (event.kind == ObservedEvent::RESULTS) {
            line.addText("outcome", nameOf(event.recognition->getOutcome()))
                .addText("requestId", event.recognition->getRequestId())
                .addJson("hypotheses", makeHypotheses(*event.recognition->getResults()));
        }
        put(line, isTerminal);
        openEvents.push_back(eventCount++);
        terminalDepth = isTerminal ? openEvents.size() : terminalDepth;
    });
}

void RecordingObserver::onEventEnd() noexcept {
    record([this] {
        const bool isTerminal = terminalDepth > 0 && openEvents.size() == terminalDepth;
        openEvents.pop_back();
        if (isTerminal) {
            finish("over");
        }
    });
}

}  // namespace Talvox
