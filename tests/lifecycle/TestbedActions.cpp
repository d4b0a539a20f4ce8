// What the application, the recorder and the device do.
#include <algorithm>
#include <boost/make_shared.hpp>

#include "Configuration.h"
#include "Sounds.h"
#include "Testbed.h"
#include "core/network/NetworkManager.h"
#include "core/util/EventLock.h"

namespace Lifecycle {

using Talvox::Settings;
using Talvox::SpeechError;

namespace {

int64_t getDurationMs(const Sound::SoundDataBuffer& buffer) {
    const int rate = buffer.getInfo().getSampleRate();
    const int64_t samples = buffer.getSampleCount();
    return rate > 0 && samples > 0 ? samples * 1000 / rate : 0;
}

}  // namespace

void Testbed::perform(const Step& step) {
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

void Testbed::act(Action action, Session* target, int amount) {
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
void Testbed::call(Action action, Session& session) {
    Talvox::Recognizer* const recognizer = session.recognizer.get();
    session.enter();
    switch (action) {
        case Action::START:
            start(session, *recognizer);
            break;
        case Action::STOP:
            session.model->beginStop(now());
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

void Testbed::create(bool starts) {
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

void Testbed::start(Session& session, Talvox::Recognizer& recognizer) {
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

std::optional<int> Testbed::findRefusal(const Session& session) const {
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

void Testbed::callGetters(const Session* session) {
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

void Testbed::useSettings(int index) {
    settingsInUse = index;
    engine().setTalvoxSettings(settings[static_cast<std::size_t>(index)]);
}

void Testbed::playSound(const Step& step, Session& session) {
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

void Testbed::deliver(Session& session, const BufferPtr& buffer, bool rude) {
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

void Testbed::failRecorder(Session& session) {
    const Util::EventLock lock;
    if (session.recorder) {
        session.enter();
        session.recorder->fail();
        session.leave();
    }
}

void Testbed::sayAsDevice(Session& session, Saying what) {
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
    if (what != Saying::NOTHING) {
        session.relay->onHeard(now());
    }
    const auto event = EVENTS.find(what);
    if (event != EVENTS.end()) {
        session.relay->beginSaying(event->second, now(), DEVICE_ERROR);
    }
    device->say(session.deviceHandle, what, session.index);
    session.relay->endSaying();
    session.leave();
}

bool Testbed::onDeviceMade(int64_t handle) {
    Session& session = *starting.back();
    session.deviceHandle = handle;
    if (session.plan.device.throwsWhenMade) {
        session.relay->onThrown(SpeechError::ErrorNotAvailable);
        // That is reported to crash reports as well.
        ++expectedAsserts;
    }
    return !session.plan.device.throwsWhenMade;
}

bool Testbed::onDeviceAsked(int64_t handle, const std::string& what) {
    const auto found =
        std::find_if(sessions.begin(), sessions.end(),
                     [handle](const auto& session) { return session->deviceHandle == handle; });
    Session& session = **found;
    const DevicePlan& plan = session.plan.device;
    sayAsDevice(session, what == "start"  ? plan.insideStart
                         : what == "stop" ? plan.insideStop
                                          : plan.insideCancel);
    if (what == "start" && plan.throwsAtStart) {
        session.relay->onThrown(SpeechError::ErrorNotAvailable);
        return false;
    }
    if (what == "stop" && plan.throwsAtStop) {
        session.relay->onThrown(SpeechError::ErrorUnknown);
        return false;
    }
    return what != "cancel" || !plan.throwsAtCancel;
}

}  // namespace Lifecycle
