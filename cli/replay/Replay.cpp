// The replay goes through the lines of a recording in their order. Those that came into the session
// (calls, buffers, failures of the recorder, answers) are applied at their recorded time, after the
// clock has been moved there, which lets the engine's own timers fire. After each of them
// everything that follows has happened: commands for the network have run, workers are idle, what
// was posted to the event thread has been delivered. What the session did then is compared by
// `EventComparison`.
//
// `start` is applied at the time of the line `started`: the session counts its limits from there,
// and the clock stands still during the call.
//
// The last end of a request is posted to the event thread, so other input may have come between
// this end (`attemptEnd`) and its delivery (`finished`): the replay holds it back until then.
#include "Replay.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <cstdint>
#include <map>
#include <optional>
#include <utility>

#include "EventComparison.h"
#include "ReplayTransport.h"
#include "cli/UsageError.h"
#include "core/network/NetworkManager.h"
#include "core/network/NetworkTaskRetryPolicy.h"
#include "core/sound/Recorder.h"
#include "core/util/EventLock.h"
#include "core/util/Time.h"
#include "pal/kd.h"
#include "talvox/RecognizerListener.h"
#include "talvox/Talvox.h"

namespace Cli {

namespace {

using nlohmann::json;

constexpr int64_t ZERO_TIME = 1000 * Util::NS_PER_S;
constexpr int64_t MOST_LATENESS_NS = Util::NS_PER_S;
/** As the engine's own, which a recording does not hold. */
constexpr int ATTEMPTS_MAX = 2;

/** Does what the recorded recorder did. Under the event lock. */
class ReplayRecorder : public Sound::Recorder {
  public:
    /** @param failsIn the calls ("init", "start", "stop") inside of which it fails */
    ReplayRecorder(bool isWorking, std::vector<std::string> failsIn)
        : works(isWorking), failures(std::move(failsIn)) {}

    bool init() override {
        failIn("init");
        return works;
    }
    void startRecording() override {
        failIn("start");
        Recorder::startRecording();
    }
    void stopRecording() override {
        failIn("stop");
        Recorder::stopRecording();
    }

    void deliver(const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer) {
        if (isRecording()) {
            notifyData(buffer);
        }
    }
    void fail() { notifyError(); }

  private:
    void failIn(const std::string& call) {
        const auto found = std::find(failures.begin(), failures.end(), call);
        if (found != failures.end()) {
            failures.erase(found);
            notifyError();
        }
    }

    const bool works;
    std::vector<std::string> failures;
};

/** Makes the calls that were made from inside of events. */
class ReplayListener : public Talvox::RecognizerListener {
  public:
    explicit ReplayListener(std::function<void()> eventAction) : onEvent(std::move(eventAction)) {}

    void onRecordingBegin(Talvox::Recognizer* /*recognizer*/) override { onEvent(); }
    void onSpeakingBegin(Talvox::Recognizer* /*recognizer*/) override { onEvent(); }
    void onRecordingDone(Talvox::Recognizer* /*recognizer*/) override { onEvent(); }
    void onBufferReceived(Talvox::Recognizer* /*recognizer*/,
                          const Sound::SoundDataBuffer& /*buffer*/) override {
        onEvent();
    }
    void onPowerChanged(Talvox::Recognizer* /*recognizer*/, float /*power*/) override { onEvent(); }
    void onResults(Talvox::Recognizer* /*recognizer*/,
                   boost::shared_ptr<Talvox::Recognition> /*recognition*/) override {
        onEvent();
    }
    void onError(Talvox::Recognizer* /*recognizer*/, Talvox::SpeechError /*error*/) override {
        onEvent();
    }

  private:
    const std::function<void()> onEvent;
};

bool isKind(const json& line, const char* kind) {
    return line["kind"] == kind;
}

std::vector<json> selectEvents(const std::vector<json>& lines) {
    std::vector<json> events;
    std::copy_if(lines.begin(), lines.end(), std::back_inserter(events),
                 [](const json& line) { return isKind(line, "event"); });
    return events;
}

class Replay {
  public:
    explicit Replay(const RecordedSession& session)
        : recorded(session),
          comparison(boost::make_shared<EventComparison>(selectEvents(session.lines), ZERO_TIME,
                                                         MOST_LATENESS_NS)),
          transport(boost::make_shared<ReplayTransport>()) {
        kdUseManualClockKOR(ZERO_TIME);
        Network::NetworkManager& network = Network::NetworkManager::getInstance();
        network.overrideReachability(session.description.value("reachability", 1));
        network.setTransport(transport);
        recorder = makeRecorder();
        Sound::Recorder::setFactory([this] { return recorder; });
        Talvox::SessionObserver::setFactory(
            [this](const Talvox::Recognizer&) { return comparison; });
    }
    ~Replay() {
        {
            const Util::EventLock lock;
            recognizer.reset();
        }
        Talvox::SessionObserver::setFactory({});
        Sound::Recorder::setFactory({});
        Network::NetworkManager& network = Network::NetworkManager::getInstance();
        network.setTransport(nullptr);
        network.overrideReachability(-1);
        Talvox::Talvox::getInstance().setTalvoxSettings(boost::make_shared<Talvox::Settings>());
        kdUseRealClockKOR();
    }
    Replay(const Replay&) = delete;
    Replay& operator=(const Replay&) = delete;

    ReplayResult run() {
        makeRecognizer();
        std::size_t eventsBefore = 0;
        for (const json& line : recorded.lines) {
            if (isKind(line, "event")) {
                ++eventsBefore;
            } else if (isInput(line)) {
                moveTo(line);
                comparison->expectEvents(eventsBefore);
                apply(line);
                settle();
            } else if (isKind(line, "end") && line.contains("t")) {
                moveTo(line);
            }
            if (!comparison->getDifference().empty()) {
                break;
            }
        }
        comparison->expectEvents(eventsBefore);
        return {comparison->getDifference(), comparison->countRecorded()};
    }

  private:
    boost::shared_ptr<ReplayRecorder> makeRecorder() {
        bool works = true;
        std::vector<std::string> failures;
        for (const json& line : recorded.lines) {
            if (isKind(line, "recorder") && line.contains("works")) {
                works = line["works"].get<bool>();
            } else if (isKind(line, "recorderError") && line.contains("in")) {
                failures.push_back(line["in"].get<std::string>());
            }
        }
        return boost::make_shared<ReplayRecorder>(works, failures);
    }

    void makeRecognizer() {
        for (const json& line : recorded.lines) {
            if (isKind(line, "call") && line.contains("in")) {
                callsInEvents[line["in"].get<int>()].push_back(line["call"].get<std::string>());
            } else if (isKind(line, "started")) {
                startTime = line["t"].get<int64_t>();
            } else if (isKind(line, "settings")) {
                laterSettings = readSettings(line.at("engine"));
            }
        }
        Talvox::Talvox& engine = Talvox::Talvox::getInstance();
        engine.setTalvoxSettings(readSettings(recorded.description.at("engine")));
        listener = boost::make_shared<ReplayListener>([this] { callInEvent(); });
        recognizer =
            engine.createRecognizer(listener, readSettings(recorded.description.at("recognizer")));
    }

    void callInEvent() {
        const auto calls = callsInEvents.find(comparison->getOpenEvent());
        if (calls != callsInEvents.end()) {
            for (const std::string& name : std::exchange(calls->second, {})) {
                call(name);
            }
        }
    }

    void call(const std::string& name) {
        const boost::shared_ptr<Talvox::Recognizer> session = recognizer;
        if (!session) {
            return;
        }
        if (name == "start") {
            session->start();
        } else if (name == "stop") {
            session->stop();
        } else if (name == "cancel") {
            session->cancel();
        } else if (name == "release") {
            recognizer.reset();
        }
    }

    static bool isInput(const json& line) {
        for (const char* const kind : {"buffer", "head", "body", "attemptEnd", "finished"}) {
            if (isKind(line, kind)) {
                return true;
            }
        }
        return (isKind(line, "call") || isKind(line, "recorderError")) && !line.contains("in");
    }

    void moveTo(const json& line) {
        int64_t time = line.at("t").get<int64_t>();
        if (!hasStarted && startTime) {
            time = *startTime;
        }
        const int64_t ahead = ZERO_TIME + time - kdGetTimeUST();
        if (ahead > 0) {
            kdAdvanceClockKOR(ahead);
        }
        settle();
    }

    void settle() {
        do {
            comparison->waitForWorkers();
            kdDrainEventsKOR();
        } while (transport->runCommands());
    }

    void apply(const json& line) {
        const Util::EventLock lock;
        const int attempt = line.value("attempt", 0);
        if (isKind(line, "call")) {
            call(line["call"].get<std::string>());
            if (!hasStarted && laterSettings) {
                Talvox::Talvox::getInstance().setTalvoxSettings(laterSettings);
            }
            hasStarted = true;
        } else if (isKind(line, "buffer")) {
            recorder->deliver(makeBuffer(line));
        } else if (isKind(line, "recorderError")) {
            recorder->fail();
        } else if (isKind(line, "head")) {
            transport->deliverHead(attempt, makeHead(line));
        } else if (isKind(line, "body")) {
            transport->deliverBody(attempt, line["bytes"].get<std::size_t>());
        } else if (isKind(line, "attemptEnd")) {
            endAttempt(attempt, {line["code"].get<int>(), line.value("reason", "")});
        } else if (lastEnd) {
            transport->deliverEnd(lastAttempt, *lastEnd);
        }
    }

    void endAttempt(int attempt, const Network::TransferEnd& how) {
        const Network::NetworkTaskBasicRetryPolicy policy(0, ATTEMPTS_MAX, false);
        if (policy.getRetryDelayMs(how.code, attempt) >= 0) {
            transport->deliverEnd(attempt, how);
        } else {
            lastAttempt = attempt;
            lastEnd = how;
        }
    }

    boost::shared_ptr<const Sound::SoundDataBuffer> makeBuffer(const json& line) const {
        const auto offset = line["offset"].get<std::size_t>();
        const auto size = line["bytes"].get<std::size_t>();
        if (offset > recorded.sound.size() || size > recorded.sound.size() - offset) {
            throw UsageError("the recording has lost sound: buffer " + line["n"].dump() +
                             " is not in it");
        }
        Sound::SoundDataInfo format(Sound::SoundDataInfo::NONE, 1,
                                    recorded.description.at("sampleRate").get<int>(), 2,
                                    line["samples"].get<int>());
        if (line.contains("format")) {
            const json& odd = line["format"];
            format = {static_cast<Sound::SoundDataInfo::Codec>(odd.at(0).get<int>()),
                      odd.at(1).get<int>(), odd.at(2).get<int>(), odd.at(3).get<int>(),
                      line["samples"].get<int>()};
        }
        const char* const begin = recorded.sound.data() + offset;
        return boost::make_shared<Sound::SoundDataBuffer>(
            format, std::vector<unsigned char>(begin, begin + size));
    }

    static boost::shared_ptr<Network::HttpResponse> makeHead(const json& line) {
        auto head = boost::make_shared<Network::HttpResponse>(line["status"].get<int>());
        for (const auto& [name, value] : line["headers"].items()) {
            head->addHeader(name, value.get<std::string>());
        }
        return head;
    }

    const RecordedSession& recorded;
    const boost::shared_ptr<EventComparison> comparison;
    const boost::shared_ptr<ReplayTransport> transport;
    boost::shared_ptr<ReplayRecorder> recorder;
    boost::shared_ptr<ReplayListener> listener;
    boost::shared_ptr<Talvox::Recognizer> recognizer;
    std::map<int, std::vector<std::string>> callsInEvents;
    std::optional<int64_t> startTime;
    boost::shared_ptr<Talvox::Settings> laterSettings;
    bool hasStarted = false;
    int lastAttempt = 0;
    std::optional<Network::TransferEnd> lastEnd;
};

}  // namespace

ReplayResult replay(const RecordedSession& recorded) {
    try {
        return Replay(recorded).run();
    } catch (const json::exception& exception) {
        throw UsageError(std::string("the recording is damaged: ") + exception.what());
    }
}

}  // namespace Cli
