#include "SessionRun.h"

#include <boost/make_shared.hpp>
#include <cstdio>
#include <exception>
#include <new>
#include <vector>

#include "Control.h"
#include "Words.h"
#include "core/network/NetworkManager.h"
#include "core/sound/FileRecorder.h"
#include "core/util/EventLock.h"
#include "logcollector/LogCollector.h"
#include "pal/kd.h"
#include "talvox/Talvox.h"

namespace Torture {

namespace {

using Talvox::Settings;

constexpr std::int64_t NS_PER_MS = 1000000;
constexpr int BUFFER_MS = 100;
constexpr std::size_t BYTES_PER_BUFFER = 3200;

/** Two buffers of noise, 700 ms of speech by the detector's settings, and the end of speech. */
constexpr int BUFFERS_OF_AN_UTTERANCE = 11;
constexpr int BUFFERS_TO_THE_MIDDLE = 7;
constexpr int BUFFERS_CAPTURED = 3;
constexpr int BUFFERS_WITHOUT_VOICE = 55;
const char* const SHORT_SPEECH = "activityon=-1;activityoff=2;minvoicetimems=600";
const char* const NEVER_SPEECH = "activityon=2";

/** On the platform clock: longer than any limit of a session after its sound. */
constexpr std::int64_t LONGEST_WAIT_MS = 70000;
constexpr std::int64_t STEP_MS = 500;

/** In real time: how long an answer of this machine may take before the clock moves on. */
constexpr std::chrono::milliseconds STEP{20};
constexpr std::chrono::milliseconds STEP_OF_A_SOUND_SESSION{10000};
constexpr std::chrono::milliseconds CAPTURE_STEP{2};
constexpr int CAPTURE_STEPS_MAX = 1000;

}  // namespace

SessionRun::SessionRun(const Plan& thePlan, const Order& theOrder, Turn theTurn,
                       SessionOutcome& target)
    : plan(thePlan),
      order(theOrder),
      turn(theTurn),
      outcome(target),
      listener(boost::make_shared<OutcomeListener>(target)),
      engineSettings(boost::make_shared<Settings>()),
      ownSettings(boost::make_shared<Settings>()),
      bytes(BYTES_PER_BUFFER, '\7') {
    const bool isFirst = turn == Turn::FIRST;
    engineSettings->putString(Settings::SKS_UUID, isFirst ? FIRST_UUID : NEXT_UUID);
    engineSettings->putString(Settings::SKS_URL, isFirst ? order.url : order.nextUrl);
    engineSettings->putString(Settings::SKS_SOUND_FORMAT, plan.speex ? Settings::SOUND_FORMAT_SPEEX
                                                                     : Settings::SOUND_FORMAT_PCM);
    engineSettings->putBoolean(Settings::SKS_STREAMING, plan.chunked);
    engineSettings->putString(Settings::SKS_VAD_SETTINGS,
                              plan.ending == Plan::Ending::NO_VOICE ? NEVER_SPEECH : SHORT_SPEECH);
}

SessionRun::~SessionRun() = default;

// An exception that leaves the API is noted, and the application goes on.
void SessionRun::call(const char* name, const std::function<void()>& function) {
    try {
        const InEngine inEngine;
        function();
    } catch (const std::exception& exception) {
        std::snprintf(outcome.exception, sizeof(outcome.exception), "%s: %s", name,
                      exception.what());
    }
}

void SessionRun::run() {
    if (!findEngine()) {
        return;
    }
    configure();
    create();
    if (session) {
        call("start", [this] { session->start(); });
        log();
        play();
        interfere();
        awaitEnd();
    }
    release();
}

// The first use makes the engine, and may throw.
bool SessionRun::findEngine() {
    try {
        const InEngine inEngine;
        engine = &Talvox::Talvox::getInstance();
    } catch (const std::bad_alloc&) {
        engine = nullptr;
    }
    return engine != nullptr;
}

void SessionRun::configure() {
    Network::NetworkManager& network = Network::NetworkManager::getInstance();
    network.overrideReachability(plan.asksNetwork ? -1 : Network::NetworkManager::WIFI);
    if (plan.tls) {
        network.setCertificateFile(order.certificates);
    }
    kdMountKOR("/removable", plan.dumps ? order.directory : nullptr);
    chooseRecorder();
    call("setTalvoxSettings", [this] { engine->setTalvoxSettings(engineSettings); });
}

void SessionRun::chooseRecorder() {
    if (plan.sound == Plan::Sound::SERVER) {
        Sound::Recorder::setFactory({});
    } else if (plan.sound == Plan::Sound::FILE) {
        Sound::Recorder::setFactory([]() -> boost::shared_ptr<Sound::Recorder> {
            return boost::make_shared<Sound::FileRecorder>(
                std::vector<int16_t>(BYTES_PER_BUFFER * BUFFERS_OF_AN_UTTERANCE / 2, 7));
        });
    } else {
        Sound::Recorder::setFactory([this]() -> boost::shared_ptr<Sound::Recorder> {
            return recorder = boost::make_shared<PushedRecorder>();
        });
    }
}

void SessionRun::create() {
    call("createRecognizer", [this] { session = engine->createRecognizer(listener, ownSettings); });
    outcome.created = session ? 1 : 0;
}

void SessionRun::log() {
    if (!plan.logs) {
        return;
    }
    // Arguments are the application's.
    const std::map<std::string, std::string> params = {{"name", "value"}};
    const std::string uuid = FIRST_UUID;
    const std::string url = order.logUrl;
    const std::string id = "session";
    const std::string begun = "begun";
    const std::string failed = "failed";
    call("usage log", [&] {
        LogCollector::setLoggingEnabled(true);
        LogCollector::configure(uuid, url);
        LogCollector::startSession(id);
        LogCollector::logEvent(id, begun, params);
        LogCollector::logError(id, failed, params);
        LogCollector::stopSession(id);
    });
}

void SessionRun::play() {
    const bool isCut = plan.ending == Plan::Ending::STOP || plan.ending == Plan::Ending::CANCEL ||
                       plan.ending == Plan::Ending::RELEASE;
    int buffers = isCut && turn == Turn::FIRST ? BUFFERS_TO_THE_MIDDLE : BUFFERS_OF_AN_UTTERANCE;
    if (plan.ending == Plan::Ending::NO_VOICE) {
        buffers = BUFFERS_WITHOUT_VOICE;
    }
    if (plan.sound == Plan::Sound::SERVER) {
        awaitCapture(BUFFERS_CAPTURED);
    } else if (plan.sound == Plan::Sound::FILE) {
        playPaced(buffers + 1);
    } else {
        playPushed(buffers);
    }
}

void SessionRun::playPushed(int buffers) {
    for (int i = 0; i < buffers; ++i) {
        advance(BUFFER_MS);
        push();
        kdDrainEventsKOR();
    }
}

void SessionRun::playPaced(int buffers) {
    for (int i = 0; i < buffers; ++i) {
        advance(BUFFER_MS);
        kdDrainEventsKOR();
    }
}

/** The sound server's time is real; the platform clock stands still unless nothing comes. */
void SessionRun::awaitCapture(int buffers) {
    for (int i = 0; i < CAPTURE_STEPS_MAX && listener->countBuffers() < buffers; ++i) {
        if (listener->waitForEnd(CAPTURE_STEP)) {
            return;
        }
    }
}

// As a device does on a thread of its own: an exception would end that thread, and the sound.
void SessionRun::push() {
    boost::shared_ptr<Sound::CaptureQueue> queue;
    if (recorder) {
        const Util::EventLock lock;
        queue = recorder->getQueue();
    }
    if (queue) {
        call("the device's thread", [&] {
            queue->push(reinterpret_cast<const unsigned char*>(bytes.data()), bytes.size());
        });
    }
}

void SessionRun::advance(std::int64_t ms) {
    call("a timer", [ms] { kdAdvanceClockKOR(ms * NS_PER_MS); });
}

void SessionRun::interfere() {
    if (plan.sound == Plan::Sound::SERVER ||
        (plan.ending == Plan::Ending::STOP && turn == Turn::FIRST)) {
        call("stop", [this] { session->stop(); });
    }
    if (turn == Turn::NEXT) {
        return;
    }
    if (plan.ending == Plan::Ending::CANCEL || plan.ending == Plan::Ending::CANCEL_SENDING) {
        call("cancel", [this] { session->cancel(); });
    } else if (plan.ending == Plan::Ending::RELEASE) {
        release();
    }
}

void SessionRun::awaitEnd() {
    const auto step = turn == Turn::FIRST ? STEP : STEP_OF_A_SOUND_SESSION;
    for (std::int64_t waited = 0; session && waited <= LONGEST_WAIT_MS; waited += STEP_MS) {
        if (listener->waitForEnd(step)) {
            return;
        }
        if (turn == Turn::NEXT && plan.ending != Plan::Ending::NO_VOICE) {
            return;
        }
        advance(STEP_MS);
    }
}

void SessionRun::release() {
    call("release", [this] { session.reset(); });
    recorder.reset();
}

}  // namespace Torture
