#include "Testbed.h"

#include <algorithm>
#include <boost/make_shared.hpp>

#include "Configuration.h"
#include "ScriptedTransport.h"
#include "core/network/NetworkManager.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "talvox/DummyRecognizer.h"

namespace Lifecycle {

using Talvox::Settings;
using Talvox::SpeechError;

namespace {

const int64_t NS_PER_MS = 1000000;
const int64_t CLOCK_START = Testbed::CLOCK_START_MS * NS_PER_MS;
const int64_t LONGEST_PIECE_MS = 1000;
/** After this the last session is over, whatever happened before. */
const int64_t ALL_OVER_MS = 120000;
const int MOST_TURNS = 10000;
const int ATTEMPTS_MAX = 2;

/** The sound in the body of a request. */
std::string findSound(const std::string& body) {
    const std::string headEnd = "\r\n\r\n";
    const std::size_t field = body.find("name=\"audio\"");
    const std::size_t head = field == std::string::npos ? field : body.find(headEnd, field);
    if (head == std::string::npos) {
        return "";
    }
    const std::size_t begin = head + headEnd.size();
    return body.substr(begin, body.find("\r\n--", begin) - begin);
}

}  // namespace

Testbed::Testbed() {
    for (int i = 0; i < SETTINGS_COUNT; ++i) {
        settings.push_back(makeEngineSettings(i));
    }
    probe = boost::make_shared<Talvox::DummyRecognizer>(&engine(), settings[0]);
    Sound::Recorder::setFactory([this]() -> boost::shared_ptr<Sound::Recorder> {
        Session& session = *starting.back();
        session.recorder = boost::make_shared<RecorderDouble>(
            session.plan.recorder, [&session] { session.cloud->onRecorderFailed(); });
        return session.recorder;
    });
    ScriptedTransport::install();
    device = Device::make(*this);
}

Testbed::~Testbed() {
    Sound::Recorder::setFactory({});
    Network::NetworkManager::getInstance().overrideReachability(-1);
    engine().setTalvoxSettings(boost::make_shared<Settings>());
    kdUseRealClockKOR();
}

int64_t Testbed::now() const {
    return kdGetTimeUST() / NS_PER_MS;
}

std::string Testbed::run(const Sequence& what, std::ostream* trace) {
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

void Testbed::begin(const Sequence& what) {
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
std::size_t Testbed::performTogether(std::size_t index) {
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

void Testbed::wait(int64_t milliseconds) {
    const int64_t until = now() + milliseconds;
    for (int64_t left = milliseconds; left > 0 && wrong.empty(); left = until - now()) {
        const int64_t due = ScriptedGateway::instance().getNextDue() / NS_PER_MS - now();
        jump(std::min({left, LONGEST_PIECE_MS, std::max<int64_t>(due, 1)}));
        settle();
    }
}

void Testbed::jump(int64_t milliseconds) {
    const Util::EventLock lock;
    kdAdvanceClockKOR(milliseconds * NS_PER_MS);
}

// All that follows from what was done has happened afterwards: on the event thread, on the workers
// and, unless it stands still, on the network. Nothing happens while steps are joined.
void Testbed::settle() {
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

void Testbed::check() {
    for (const std::unique_ptr<Session>& session : sessions) {
        onWrong(session->model->checkSettled(now()));
        if (session->isLeftBehind()) {
            onWrong("a released recognizer lives on");
        }
        const bool listens = session->model->isListening() && !session->model->isGone();
        if (session->recorder && session->recorder->isRecording() && !listens) {
            onWrong("the recorder goes on");
        }
    }
    checkEngine();
    if (asserts.count() > expectedAsserts) {
        onWrong("assertion " + asserts.reports().back().condition);
    }
}

void Testbed::checkEngine() {
    const bool isFree = engine().registerRecognizer(probe.get());
    engine().unregisterRecognizer(probe.get());
    if (isFree == isAnyActive()) {
        onWrong(isFree ? "the active session is not registered" : "the engine is not free");
    }
}

bool Testbed::isAnyActive() const {
    return std::any_of(sessions.begin(), sessions.end(), [](const auto& session) {
        return !session->model->isGone() && session->model->isActive();
    });
}

// Whatever happened, time alone ends every session and every upload, and nothing is left.
void Testbed::end() {
    networkStands = false;
    ScriptedGateway::instance().setAnswersFirst(false);
    note("- the end");
    settle();
    for (int64_t waited = 0; waited < ALL_OVER_MS && wrong.empty() &&
                             (isAnyActive() || ScriptedGateway::instance().countTransfers() > 0);
         waited += LONGEST_PIECE_MS) {
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

void Testbed::checkNothingIsLeft() {
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

Session* Testbed::find(int index) {
    if (sessions.empty()) {
        return nullptr;
    }
    const auto number = static_cast<std::size_t>(index);
    return index == NEWEST ? sessions.back().get() : sessions[number % sessions.size()].get();
}

void Testbed::onEvent(Session& session, Event event, int errorCode) {
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

void Testbed::onWrong(const std::string& what) {
    if (!what.empty() && wrong.empty()) {
        wrong = what;
        note("WRONG: ", what);
    }
}

void Testbed::onBody(int session, const std::string& body) {
    const Session& sender = *sessions[static_cast<std::size_t>(session)];
    if (sender.sendsPcm && findSound(body) != sender.spoken) {
        onWrong("the request does not carry what was spoken");
    }
}

void Testbed::onHead(int session, bool words) {
    note("    gateway: head for session ", session);
    Session& asker = *sessions[static_cast<std::size_t>(session)];
    asker.gotWords = asker.gotWords || words;
}

void Testbed::onAttemptEnd(int session, int code) {
    note("    gateway: end ", code, " for session ", session);
    Session& asker = *sessions[static_cast<std::size_t>(session)];
    const bool canBeMended = code < 0 || code >= 500;
    if (asker.cloud != nullptr && (!canBeMended || ++asker.attempts >= ATTEMPTS_MAX)) {
        asker.cloud->onRequest(asker.gotWords ? CloudModel::Request::ANSWERED
                                              : CloudModel::Request::FAILED);
    }
}

}  // namespace Lifecycle
