#include "Scene.h"

#include <arpa/inet.h>
#include <fcntl.h>
#include <net/if.h>
#include <netinet/in.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <boost/make_shared.hpp>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <stdexcept>

#include "SilentNameServer.h"
#include "cloud/Sounds.h"
#include "core/network/NetworkManager.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"

namespace TearDown {

namespace {

using Talvox::Settings;
using TestSupport::Answer;
using TestSupport::ScriptedHttpServer;

const char* const UUID = "0123456789abcdef0123456789abcdef";
const char* const SHORT_SPEECH = "activityon=-1;activityoff=2;minvoicetimems=600";
const char* const ENDLESS_SPEECH = "activityon=-1;activityoff=-1";
const int64_t NS_PER_BUFFER = 100000000;
const int BUFFERS_TO_THE_END = 11;
const int BUFFERS_OF_A_LOT = 100;

// Never destroyed: the application ends while its connections are open.
ScriptedHttpServer& makeSilentServer(const Answer& answer) {
    auto* const made = new ScriptedHttpServer;
    made->setDefaultAnswer(answer);
    return *made;
}

void require(bool reached, const char* what) {
    if (!reached) {
        throw std::runtime_error(std::string("not reached: ") + what);
    }
}

/** A network of one's own begins without even this. */
void switchLoopbackOn() {
    const int descriptor = ::socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    ifreq request{};
    std::strcpy(request.ifr_name, "lo");
    request.ifr_flags = IFF_UP | IFF_RUNNING;
    require(::ioctl(descriptor, SIOCSIFFLAGS, &request) == 0, "the loopback interface");
    ::close(descriptor);
}

/** A socket at which questions arrive and stay. */
int openNameServer(const std::string& address) {
    const int descriptor = ::socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    sockaddr_in name{};
    name.sin_family = AF_INET;
    name.sin_port = htons(53);
    require(::inet_pton(AF_INET, address.c_str(), &name.sin_addr) == 1 &&
                ::bind(descriptor, reinterpret_cast<sockaddr*>(&name), sizeof(name)) == 0,
            "a name server");
    return descriptor;
}

}  // namespace

Scene::Scene(const Options& words)
    : options(words),
      server(makeSilentServer(words.get("gateway") == "unread" ? Answer::never().notReading()
                                                               : Answer::never())),
      logServer(makeSilentServer(Answer::never())) {
    if (options.has("nameserver")) {
        switchLoopbackOn();
        nameServer = openNameServer(options.get("nameserver"));
    }
}

std::string Scene::getUrl() const {
    if (options.get("gateway") == "name") {
        return std::string("http://") + SILENT_HOST;
    }
    return options.get("gateway") == "real" ? "http://host.example" : server.getUrl();
}

void Scene::configure() {
    const auto settings = boost::make_shared<Settings>();
    settings->putString(Settings::SKS_UUID, UUID);
    settings->putString(Settings::SKS_URL, getUrl());
    settings->putString(Settings::SKS_SOUND_FORMAT, options.get("format") == "speex"
                                                        ? Settings::SOUND_FORMAT_SPEEX
                                                        : Settings::SOUND_FORMAT_PCM);
    settings->putBoolean(Settings::SKS_STREAMING, options.get("mode") == "chunked");
    const bool records = options.get("gateway") == "body" || options.has("encoder");
    settings->putString(Settings::SKS_VAD_SETTINGS, records ? ENDLESS_SPEECH : SHORT_SPEECH);
    Talvox::Talvox::getInstance().setTalvoxSettings(settings);
    Network::NetworkManager::getInstance().overrideReachability(Network::NetworkManager::WIFI);
}

void Scene::chooseRecorder() {
    Sound::Recorder::setFactory([this]() -> boost::shared_ptr<Sound::Recorder> {
        if (options.get("recorder") == "hang") {
            return hanging = boost::make_shared<HangingRecorder>();
        }
        return scripted = boost::make_shared<CloudTest::ScriptedRecorder>();
    });
    if (options.get("recorder") == "pulse") {
        Sound::Recorder::setFactory({});
    }
}

void Scene::prepare(const boost::shared_ptr<Talvox::RecognizerListener>& listener) {
    configure();
    hangAnotherRecorder();
    chooseRecorder();
    const bool livesInRealTime = options.get("recorder") == "pulse";
    if (!livesInRealTime) {
        kdUseManualClockKOR(1000000000);
    }
    session =
        Talvox::Talvox::getInstance().createRecognizer(listener, boost::make_shared<Settings>());
    session->start();
    reachStage();
    startLog();
    if (options.has("encoder")) {
        play(BUFFERS_OF_A_LOT);
    }
}

void Scene::play(int buffers) {
    for (int i = 0; i < buffers; ++i) {
        kdAdvanceClockKOR(NS_PER_BUFFER);
        scripted->deliver(CloudTest::makeConstantBuffer(static_cast<int16_t>(i)));
    }
}

void Scene::reachStage() {
    const std::string gateway = options.get("gateway");
    if (hanging) {
        hanging->waitUntilHanging();
        require(kdDrainEventsKOR() == 0, "the sound of the device");
    } else if (scripted) {
        play(gateway == "body" ? BUFFERS_TO_THE_END / 2 : BUFFERS_TO_THE_END);
    }
    if (gateway == "none") {
        return;
    }
    if (gateway == "name") {
        require(waitForQuestions(++questions), "the question for the gateway's name");
    } else if (gateway == "real") {
        std::array<char, 512> question{};
        require(::recv(nameServer, question.data(), question.size(), 0) > 0, "a question");
    } else if (gateway == "answer") {
        require(server.waitForRequest(++requests), "the whole request");
    } else if (gateway == "body") {
        require(server.waitForBody(requests++, 1000), "the sound");
    } else {
        require(server.waitForHead(++requests), "the head of the request");
    }
}

void Scene::hangAnotherRecorder() {
    const std::string fifo = options.get("fifo");
    if (fifo.empty()) {
        return;
    }
    ::setenv("PULSE_CLIENTCONFIG", fifo.c_str(), 1);
    const Util::EventLock lock;
    Sound::Recorder::setFactory({});
    another = Sound::Recorder::createRecorder();
    another->init();
    another->startRecording();
    // Returns when the other side has been opened; from then on it waits for the first byte.
    require(::open(fifo.c_str(), O_WRONLY | O_CLOEXEC) >= 0, "the settings file");
}

void Scene::startLog() {
    if (options.has("log") && LogCollector::getPendingCount() == 0) {
        LogCollector::setLoggingEnabled(true);
        LogCollector::configure(UUID, logServer.getUrl());
        LogCollector::startSession("main");
        LogCollector::logEvent("main", "begun", {});
        require(logServer.waitForHead(++logRequests), "the request of the usage log");
    }
}

void Scene::cleanUp() {
    scripted.reset();
    hanging.reset();
    const Util::EventLock lock;
    another.reset();
    Sound::Recorder::setFactory({});
}

}  // namespace TearDown
