#include "World.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <optional>
#include <ostream>
#include <utility>

#include "Sounds.h"
#include "core/network/NetworkManager.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "talvox/DummyRecognizer.h"

namespace Lifecycle {

using Talvox::Settings;
using Talvox::SpeechError;

namespace {

const int64_t NS_PER_MS = 1000000;
const int64_t CLOCK_START = 1000000 * NS_PER_MS;
const int64_t LONGEST_PIECE_MS = 1000;
/** After this the last session is over, whatever happened before. */
const int64_t ALL_OVER_MS = 120000;
const int MOST_TURNS = 10000;
const int ATTEMPTS_MAX = 2;

const char* const URL = "http://gateway.invalid";
const char* const UUID = "0123456789abcdef0123456789abcdef";

/** Which of the engine's settings a sequence uses: all that matter, and some that are bad. */
boost::shared_ptr<Settings> makeSettings(int index) {
    static const char* const DETECTORS[] = {
        "activityon=-1;activityoff=2;minvoicetimems=600",  // speech for 700 ms
        "activityon=-1;activityoff=-1",                    // speech without an end
        "activityon=2"                                     // no speech
    };
    auto settings = boost::make_shared<Settings>();
    settings->putString(Settings::SKS_URL, URL);
    settings->putString(Settings::SKS_UUID, UUID);
    settings->putString(Settings::SKS_VAD_SETTINGS, DETECTORS[index % 8 < 4 ? 0 : 1 + index % 2]);
    settings->putBoolean(Settings::SKS_STREAMING, index % 2 == 1);
    settings->putString(Settings::SKS_SOUND_FORMAT, index % 6 == 5 ? Settings::SOUND_FORMAT_SPEEX
                                                    : index % 6 == 4
                                                        ? Settings::SOUND_FORMAT_PCM_IF_WIFI
                                                        : Settings::SOUND_FORMAT_PCM);
    switch (index) {
        case 18:
            settings->putString(Settings::SKS_URL, "");
            break;
        case 19:
            settings->putString(Settings::SKS_UUID, "");
            break;
        case 20:
        case 21:
            settings->putString(Settings::SKS_URL, "http://gateway.invalid/with a blank");
            break;
        case 22:
            settings->putInt(Settings::SKS_VERBOSE_LEVEL, 2);
            settings->putInt(Settings::SKS_SAMPLE_RATE, 8000);
            break;
        case 23:
            settings->putString(Settings::SKS_SESSION_MODE, Settings::SESSION_MODE_GENERAL);
            break;
        default:
            break;
    }
    return settings;
}

boost::shared_ptr<Settings> makeSessionSettings(const SessionPlan& plan, int index) {
    static const std::string* const LOGGING[] = {
        &Settings::LOG_DISABLED, &Settings::LOG_WITH_SOUND_ALWAYS,
        &Settings::LOG_WITH_SOUND_IF_WIFI, &Settings::LOG_WITHOUT_SOUND_ALWAYS};
    static const auto base = boost::make_shared<Settings>();
    const boost::shared_ptr<Settings> own = base->clone();
    own->putString(Settings::RS_SESSION_ID, ScriptedGateway::makeSessionId(index));
    if (plan.kind == Kind::STAND_IN) {
        own->putString(Settings::RS_ASR_POLICY, Settings::ASRP_DISABLED);
    } else if (plan.kind == Kind::PLATFORM) {
        own->putString(Settings::RS_ASR_POLICY, Settings::ASRP_PLATFORM_ONLY);
        own->putString(Settings::SKS_LOGGING_POLICY, *LOGGING[plan.device.logging % 4]);
        own->putString(Settings::SKS_SOUND_FORMAT, plan.device.logging < 4
                                                       ? Settings::SOUND_FORMAT_PCM
                                                       : Settings::SOUND_FORMAT_SPEEX);
    }
    return own;
}

bool isSendable(const Settings& settings) {
    return settings.getUrl().find(' ') == std::string::npos;
}

int64_t getDurationMs(const Sound::SoundDataBuffer& buffer) {
    const int rate = buffer.getInfo().getSampleRate();
    const int64_t samples = buffer.getSampleCount();
    return rate > 0 && samples > 0 ? samples * 1000 / rate : 0;
}

/** The sound in the body of a request, or what else is there. */
std::string findSound(const std::string& body) {
    const std::string field = "name=\"audio\"";
    const std::size_t name = body.find(field);
    const std::size_t begin = name == std::string::npos ? name : body.find("\r\n\r\n", name);
    const std::size_t end =
        body.rfind("\r\n--", body.size() - std::min<std::size_t>(body.size(), 8));
    if (begin == std::string::npos || end == std::string::npos || end < begin + 4) {
        return "";
    }
    const std::string sound = body.substr(begin + 4, end - begin - 4);
    const std::size_t rest = sound.rfind("\r\n--");
    return rest == std::string::npos ? sound : sound.substr(0, rest);
}

}  // namespace

World::World() {
    for (int i = 0; i < SETTINGS_COUNT; ++i) {
        settings.push_back(makeSettings(i));
    }
    probe = boost::make_shared<Talvox::DummyRecognizer>(&engine(), settings[0]);
    Sound::Recorder::setFactory([this]() -> boost::shared_ptr<Sound::Recorder> {
        Session& session = *starting.back();
        session.recorder = boost::make_shared<RecorderDouble>(
            session.plan.recorder, [&session] { session.cloud->onRecorderFailed(); });
        return session.recorder;
    });
    Network::NetworkManager::getInstance().getTransport();
    device = Device::make(*this);
}

World::~World() {
    Sound::Recorder::setFactory({});
    Network::NetworkManager::getInstance().overrideReachability(-1);
    engine().setTalvoxSettings(boost::make_shared<Settings>());
    kdUseRealClockKOR();
}

int64_t World::now() const {
    return kdGetTimeUST() / NS_PER_MS;
}

std::string World::run(const Sequence& what, std::ostream* trace) {
    out = trace;
    begin(what);
    for (std::size_t i = 0; i < what.steps.size() && wrong.empty();) {
        i = performTogether(i);
        settle();
    }
    end();
    asserts.clear();
    return wrong;
}

void World::begin(const Sequence& what) {
    wrong.clear();
    expectedAsserts = 0;
    sequence = &what;
    networkStands = false;
    kdUseManualClockKOR(CLOCK_START);
    reachability = Network::NetworkManager::WIFI;
    Network::NetworkManager::getInstance().overrideReachability(reachability);
    useSettings(what.settings);
    ScriptedGateway::instance().begin(what.sessions, this);
    before = PlatformLedger::now();
}

// Steps that are joined happen in one hold of the lock. @return the index after them
std::size_t World::performTogether(std::size_t index) {
    const Step* step = &sequence->steps[index];
    if (!step->joined) {
        perform(*step);
        return index + 1;
    }
    const Util::EventLock lock;
    while (step->joined && index + 1 < sequence->steps.size()) {
        perform(*step);
        step = &sequence->steps[++index];
    }
    perform(*step);
    return index + 1;
}

void World::perform(const Step& step) {
    note("- ", step);
    networkStands = step.networkStands;
    ScriptedGateway::instance().setAnswersFirst(step.answersFirst);
    Session* const session = find(step.session);
    switch (step.action) {
        case Action::SOUND:
        case Action::LONG_SOUND:
        case Action::WHOLE_SOUND:
        case Action::ODD_SOUND:
        case Action::RUDE_SOUND:
            if (session != nullptr) {
                playSound(step, *session);
            }
            break;
        case Action::RECORDER_FAILS:
            if (session != nullptr) {
                failRecorder(*session);
            }
            break;
        case Action::DEVICE_SAYS:
            if (session != nullptr) {
                sayAsDevice(*session, static_cast<Saying>(step.amount));
            }
            break;
        case Action::WAIT:
            wait(step.amount);
            break;
        case Action::JUMP:
            jump(step.amount);
            break;
        case Action::CHANGE_REACHABILITY:
            reachability = step.amount;
            Network::NetworkManager::getInstance().overrideReachability(reachability);
            break;
        default: {
            const CallTimes::Stopwatch stopwatch(callTimes[step.action]);
            act(step.action, session, step.amount);
            break;
        }
    }
}

void World::act(Action action, Session* target, int amount) {
    const Util::EventLock lock;
    if (action == Action::CREATE || action == Action::CREATE_AND_START) {
        create(action == Action::CREATE_AND_START);
    } else if (action == Action::UPDATE_SETTINGS) {
        useSettings(amount);
    } else if (action == Action::CALL_GETTERS) {
        callGetters(target);
    } else if (target != nullptr && !target->isReleased()) {
        call(action, *target);
    }
}

// The application holds no other reference while it calls: the call may be the session's end.
void World::call(Action action, Session& session) {
    Talvox::Recognizer* const recognizer = session.recognizer.get();
    session.enter();
    switch (action) {
        case Action::START:
            start(session, *recognizer);
            break;
        case Action::STOP:
            session.model->beginStop();
            recognizer->stop();
            onWrong(session.model->endStop());
            break;
        case Action::CANCEL:
            session.model->beginCancel();
            recognizer->cancel();
            onWrong(session.model->endCancel());
            break;
        case Action::RELEASE:
            session.release();
            break;
        default:
            break;
    }
    session.leave();
}

void World::create(bool starts) {
    if (sessions.size() >= sequence->sessions.size()) {
        return;
    }
    const auto index = static_cast<int>(sessions.size());
    const SessionPlan& plan = sequence->sessions[sessions.size()];
    const bool isServed = plan.kind != Kind::PLATFORM || device != nullptr;
    sessions.push_back(
        std::make_unique<Session>(*this, index, plan, isServed ? plan.kind : Kind::STAND_IN));
    Session& session = *sessions.back();
    session.own(engine().createRecognizer(session.listener, makeSessionSettings(plan, index)));
    if (starts) {
        call(Action::START, session);
    }
}

void World::start(Session& session, Talvox::Recognizer& recognizer) {
    const bool wasActive = session.model->isActive();
    session.model->beginStart(now(), findRefusal(session));
    if (!wasActive && session.cloud != nullptr && session.model->isActive()) {
        const Settings& current = *settings[static_cast<std::size_t>(settingsInUse)];
        const std::string& format = current.getString(Settings::SKS_SOUND_FORMAT);
        session.sendsPcm =
            format == Settings::SOUND_FORMAT_PCM || (format == Settings::SOUND_FORMAT_PCM_IF_WIFI &&
                                                     reachability == Network::NetworkManager::WIFI);
        if (!isSendable(current)) {
            session.cloud->onRequest(CloudModel::Request::UNSENDABLE);
        }
    }
    starting.push_back(&session);
    recognizer.start();
    starting.pop_back();
    onWrong(session.model->endStart());
}

std::optional<int> World::findRefusal(const Session& session) const {
    const Settings& current = *settings[static_cast<std::size_t>(settingsInUse)];
    if (isAnyActive()) {
        return SpeechError::ErrorBusy;
    }
    if (session.kind != Kind::CLOUD) {
        return std::nullopt;
    }
    if (reachability == Network::NetworkManager::UNREACHABLE || current.getUrl().empty() ||
        current.getUuid().empty()) {
        return SpeechError::ErrorNetwork;
    }
    if (session.plan.recorder.refuses) {
        return SpeechError::ErrorAudio;
    }
    return std::nullopt;
}

void World::callGetters(const Session* session) {
    const boost::shared_ptr<const Settings> current = engine().getTalvoxSettings();
    if (current != settings[static_cast<std::size_t>(settingsInUse)]) {
        onWrong("the engine has other settings");
    }
    if (!engine().isRecognitionAvailable(*current) || engine().getAvailableLanguages().empty()) {
        onWrong("nothing recognises");
    }
    if (session != nullptr && !session->isReleased() &&
        (session->recognizer->getEngine() != &engine() ||
         session->recognizer->getSettings()->getSessionId() !=
             ScriptedGateway::makeSessionId(session->index))) {
        onWrong("a recognizer has forgotten what it is");
    }
}

void World::useSettings(int index) {
    settingsInUse = index;
    engine().setTalvoxSettings(settings[static_cast<std::size_t>(index)]);
}

void World::playSound(const Step& step, Session& session) {
    if (step.action == Action::ODD_SOUND) {
        deliver(session, makeOddBuffer(step.amount), false);
        return;
    }
    if (step.action == Action::RUDE_SOUND) {
        deliver(session, makeLightBuffer(session.index, SHORT_BUFFER_MS), true);
        return;
    }
    const bool isLong = step.action == Action::LONG_SOUND;
    for (int i = 0; i < step.amount && wrong.empty(); ++i) {
        wait(isLong ? LONG_BUFFER_MS : SHORT_BUFFER_MS);
        deliver(session,
                step.action == Action::WHOLE_SOUND
                    ? makeWholeBuffer(session.index)
                    : makeLightBuffer(session.index, isLong ? LONG_BUFFER_MS : SHORT_BUFFER_MS),
                false);
        settle();
    }
}

void World::deliver(Session& session, const BufferPtr& buffer, bool rude) {
    const Util::EventLock lock;
    const boost::shared_ptr<RecorderDouble> recorder = session.recorder;
    if (!recorder || (!recorder->isRecording() && !rude)) {
        return;
    }
    if (recorder->isRecording() && session.model->isListening()) {
        session.spoken.append(buffer->getData().begin(), buffer->getData().end());
    }
    session.enter();
    session.cloud->beginSound(now(), getDurationMs(*buffer));
    recorder->deliver(buffer, rude);
    onWrong(session.cloud->endSound(now()));
    session.leave();
}

void World::failRecorder(Session& session) {
    const Util::EventLock lock;
    if (session.recorder) {
        session.enter();
        session.recorder->fail();
        session.leave();
    }
}

void World::sayAsDevice(Session& session, Saying what) {
    static const std::map<Saying, Event> EVENTS = {{Saying::READY, Event::RECORDING_BEGIN},
                                                   {Saying::BEGINNING, Event::SPEAKING_BEGIN},
                                                   {Saying::LEVEL, Event::POWER},
                                                   {Saying::END, Event::RECORDING_DONE},
                                                   {Saying::RESULTS, Event::RESULTS},
                                                   {Saying::NO_HYPOTHESIS, Event::RESULTS},
                                                   {Saying::ERROR, Event::ERROR}};
    const Util::EventLock lock;
    if (session.deviceHandle == 0) {
        return;
    }
    note("      the device says ", static_cast<int>(what));
    session.enter();
    const auto event = EVENTS.find(what);
    if (event != EVENTS.end()) {
        session.relay->beginSaying(event->second, DEVICE_ERROR);
    }
    device->say(session.deviceHandle, what, session.index);
    session.relay->endSaying();
    session.leave();
}

void World::wait(int64_t milliseconds) {
    const int64_t until = now() + milliseconds;
    for (int64_t left = milliseconds; left > 0 && wrong.empty(); left = until - now()) {
        const int64_t due = ScriptedGateway::instance().getNextDue() / NS_PER_MS - now();
        jump(std::min({left, LONGEST_PIECE_MS, std::max<int64_t>(due, 1)}));
        settle();
    }
}

void World::jump(int64_t milliseconds) {
    const Util::EventLock lock;
    kdAdvanceClockKOR(milliseconds * NS_PER_MS);
}

// All that follows from what was done has happened afterwards: on the event thread, on the workers
// and, unless it stands still, on the network. Nothing happens while steps are joined.
void World::settle() {
    if (kdHoldsEventLockKOR() != 0) {
        return;
    }
    bool busy = true;
    for (int turns = 0; busy; ++turns) {
        if (turns > MOST_TURNS || !PlatformLedger::waitUntilIdle()) {
            onWrong("never comes to rest");
            return;
        }
        const Util::EventLock lock;
        busy = !networkStands && ScriptedGateway::instance().turn();
    }
    const Util::EventLock lock;
    check();
}

void World::check() {
    for (const std::unique_ptr<Session>& session : sessions) {
        onWrong(session->model->checkSettled(now()));
        if (session->isLeftBehind()) {
            onWrong("a released recognizer lives on");
        }
        if (session->recorder && session->recorder->isRecording() &&
            !session->model->isListening()) {
            onWrong("the recorder goes on");
        }
    }
    checkEngine();
    if (asserts.count() > expectedAsserts) {
        onWrong("assertion " + asserts.reports().back().condition);
    }
}

void World::checkEngine() {
    const bool isFree = engine().registerRecognizer(probe.get());
    engine().unregisterRecognizer(probe.get());
    if (isFree == isAnyActive()) {
        onWrong(isFree ? "the active session is not registered" : "the engine is not free");
    }
}

bool World::isAnyActive() const {
    return std::any_of(sessions.begin(), sessions.end(), [](const auto& session) {
        return !session->model->isGone() && session->model->isActive();
    });
}

/** A device may be silent for ever. */
void World::cancelRelays() {
    for (std::size_t i = 0; i < sessions.size(); ++i) {
        if (sessions[i]->relay != nullptr && sessions[i]->model->isActive()) {
            act(Action::CANCEL, sessions[i].get(), 0);
        }
    }
}

// Whatever happened, time alone ends every session and every upload, and nothing is left.
void World::end() {
    networkStands = false;
    ScriptedGateway::instance().setAnswersFirst(false);
    note("- the end");
    settle();
    for (int64_t waited = 0; waited < ALL_OVER_MS && wrong.empty() &&
                             (isAnyActive() || ScriptedGateway::instance().countTransfers() > 0);
         waited += LONGEST_PIECE_MS) {
        cancelRelays();
        wait(LONGEST_PIECE_MS);
    }
    checkNothingIsLeft();
    for (const std::unique_ptr<Session>& session : sessions) {
        const int heardEnds = session->witness->countEnds();
        if (session->kind != Kind::STAND_IN && !session->isReleased() &&
            session->model->isOver() != (heardEnds == 1)) {
            onWrong("the second listener heard another number of ends");
        }
        const Util::EventLock lock;
        session->release();
    }
    settle();
    checkNothingIsLeft();
    if (device && device->countReferences() != 0) {
        onWrong("references to Java objects are left");
    }
    sessions.clear();
}

void World::checkNothingIsLeft() {
    const PlatformLedger after = PlatformLedger::now();
    if (isAnyActive()) {
        onWrong("a session without an end");
    } else if (ScriptedGateway::instance().countTransfers() > 0) {
        onWrong("a request is left");
    } else if (!(after == before)) {
        onWrong("left: " + std::to_string(after.timers - before.timers) + " timers, " +
                std::to_string(after.callbacks - before.callbacks) + " callbacks, " +
                std::to_string(after.works - before.works) + " tasks");
    }
    if (!engine().runningTaskHolders.empty()) {
        onWrong("an upload is left");
    }
    for (const std::unique_ptr<Session>& session : sessions) {
        if (session->recorder && session->recorder.use_count() > 1) {
            onWrong("a recorder is kept");
        }
        if (session->listener.use_count() > 1) {
            onWrong("a listener is kept");
        }
    }
}

Session* World::find(int index) {
    if (sessions.empty()) {
        return nullptr;
    }
    const auto number = static_cast<std::size_t>(index);
    return index == NEWEST ? sessions.back().get() : sessions[number % sessions.size()].get();
}

void World::onEvent(Session& session, Event event, int errorCode) {
    note("    session ", session.index, " ", nameOf(event), errorCode >= 0 ? " " : "",
         errorCode >= 0 ? SpeechError::errorStrings[errorCode] : "");
    checkEngine();
    if (event == Event::RESULTS || event == Event::ERROR) {
        ++ends[static_cast<std::size_t>(event == Event::RESULTS ? SpeechError::ErrorMax
                                                                : errorCode)];
    }
    const int nth = session.count(event);
    for (const Reaction& reaction : session.plan.reactions) {
        if (reaction.event == event && reaction.nth == nth && wrong.empty()) {
            note("      reacts: ", reaction);
            act(reaction.action, reaction.session == SELF ? &session : find(reaction.session),
                reaction.amount);
        }
    }
}

void World::onWrong(const std::string& what) {
    if (!what.empty() && wrong.empty()) {
        wrong = what;
        note("WRONG: ", what);
    }
}

void World::onBody(int session, const std::string& body) {
    const Session& sender = *sessions[static_cast<std::size_t>(session)];
    if (sender.sendsPcm && findSound(body) != sender.spoken) {
        onWrong("the request does not carry what was spoken");
    }
}

void World::onHead(int session, bool words) {
    note("    gateway: head for session ", session);
    Session& asker = *sessions[static_cast<std::size_t>(session)];
    asker.gotWords = asker.gotWords || words;
}

void World::onAttemptEnd(int session, int code) {
    note("    gateway: end ", code, " for session ", session);
    Session& asker = *sessions[static_cast<std::size_t>(session)];
    const bool canBeMended = code < 0 || code >= 500;
    if (asker.cloud != nullptr && (!canBeMended || ++asker.attempts >= ATTEMPTS_MAX)) {
        asker.cloud->onRequest(asker.gotWords ? CloudModel::Request::ANSWERED
                                              : CloudModel::Request::FAILED);
    }
}

bool World::onDeviceMade(int64_t handle) {
    Session& session = *starting.back();
    session.deviceHandle = handle;
    if (session.plan.device.throwsWhenMade) {
        session.relay->onThrown();
        // That is reported to crash reports as well.
        ++expectedAsserts;
    }
    return !session.plan.device.throwsWhenMade;
}

bool World::onDeviceAsked(int64_t handle, const std::string& what) {
    const auto found =
        std::find_if(sessions.begin(), sessions.end(),
                     [handle](const auto& session) { return session->deviceHandle == handle; });
    Session& session = **found;
    const DevicePlan& plan = session.plan.device;
    sayAsDevice(session, what == "start"  ? plan.insideStart
                         : what == "stop" ? plan.insideStop
                                          : plan.insideCancel);
    const bool throws = what == "start" && plan.throwsAtStart;
    if (throws) {
        session.relay->onThrown();
    }
    return !throws;
}

template <typename... Parts>
void World::note(const Parts&... parts) {
    if (out != nullptr) {
        *out << now() - CLOCK_START / NS_PER_MS << " ";
        (*out << ... << parts) << "\n";
    }
}

}  // namespace Lifecycle
