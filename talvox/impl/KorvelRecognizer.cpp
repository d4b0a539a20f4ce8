#include "talvox/impl/KorvelRecognizer.h"

#include <boost/make_shared.hpp>
#include <exception>
#include <utility>

#include "core/network/NetworkManager.h"
#include "core/util/EventLock.h"
#include "core/util/Time.h"
#include "pal/kd.h"
#include "talvox/Log.h"
#include "talvox/Talvox.h"
#include "talvox/impl/EventMark.h"
#include "talvox/impl/ListeningRules.h"
#include "talvox/impl/SessionGuard.h"

namespace Talvox {

namespace {

const int LOG_LEVEL = 2;
const char* const DUMP_PATH = "/removable/in.wav";

using Util::NS_PER_MS;

/** A recorder that neither delivers a millisecond nor reports for so long has failed. */
const int64_t NO_SOUND_LIMIT_NS = 10000 * NS_PER_MS;

/** So has one that needs so long for less sound than the limit. */
const int64_t LISTENING_LIMIT_NS = 60000 * NS_PER_MS;

}  // namespace

KorvelRecognizer::KorvelRecognizer(const Talvox* facade,
                                   boost::shared_ptr<const Settings> recognizerSettings)
    : Recognizer(facade, std::move(recognizerSettings)) {}

KorvelRecognizer::~KorvelRecognizer() {
    const Util::EventLock lock;
    leaveEngine();
    observe([](SessionObserver& watcher) { watcher.onCall(SessionObserver::Call::RELEASE); });
    watchdog.reset();
    try {
        stopRecorder();
        dropProtocol();
    } catch (const std::exception& exception) {
        kdLogFormatMessage("KorvelRecognizer: an exception at the end: %s", exception.what());
    }
    wavDump.reset();
}

template <typename Report>
void KorvelRecognizer::observe(Report report) {
    if (observer) {
        report(*observer);
    }
}

template <typename Call>
void KorvelRecognizer::enter(Call call) noexcept {
    enterSession(*this, call, [this](const char* what) { endUnexpectedly(what); });
}

// The last reference may be going on another thread; then there is nothing to end.
void KorvelRecognizer::onException(const char* what) {
    const boost::shared_ptr<Recognizer> self = weak_from_this().lock();
    if (self && !isOver()) {
        endSession(what, [this](const char* text) { endUnexpectedly(text); });
    }
}

void KorvelRecognizer::endUnexpectedly(const char* what) {
    stopWithError(SpeechError::ErrorUnknown, what);
}

const std::vector<std::string>& KorvelRecognizer::getAvailableLanguages() {
    static const std::vector<std::string> LANGUAGES = {"ru-RU", "tr-TR", "uk-UA"};
    return LANGUAGES;
}

void KorvelRecognizer::start() {
    enter([this] { begin(); });
}

void KorvelRecognizer::begin() {
    if (isOver()) {
        kdLogFormatMessage("KorvelRecognizer: the session is over, start is ignored");
        return;
    }
    const bool isAdmitted = getEngine()->registerRecognizer(this);
    if (isAdmitted && !observer) {
        observer = SessionObserver::make(*this);
    }
    observe([](SessionObserver& watcher) { watcher.onCall(SessionObserver::Call::START); });
    if (!isAdmitted) {
        stopWithError(SpeechError::ErrorBusy, started ? "the session was started a second time"
                                                      : "another session is active");
        return;
    }
    started = true;
    const boost::shared_ptr<const Settings> engineSettings = getEngine()->getTalvoxSettings();
    std::string obstacle;
    if (!statusIsReasonable(*engineSettings, obstacle)) {
        stopWithError(SpeechError::ErrorNetwork, obstacle);
        return;
    }
    if (kdStartEventsKOR() != 0) {
        stopWithError(SpeechError::ErrorUnknown, NO_THREAD_REASON);
        return;
    }
    exceptionWatch.emplace(static_cast<ExceptionWatch::Owner&>(*this));
    chooseSessionMode(*engineSettings);
    if (!startRecorder(engineSettings->getSampleRate())) {
        return;
    }
    const Sound::SoundDataInfo format(Sound::SoundDataInfo::NONE, 1,
                                      engineSettings->getSampleRate(), 2);
    powerEstimator.setMode(sessionMode);
    const bool isStreaming = engineSettings->getBoolean(Settings::SKS_STREAMING);
    startProtocol(isStreaming);
    startDetector(engineSettings->getString(Settings::SKS_VAD_SETTINGS), format);
    startTime = kdGetTimeUST();
    observe([&](SessionObserver& watcher) { watcher.onStarted(startTime, isStreaming); });
    leadingNoiseDone = false;
    recordedMs = 0;
    startDump(format);
    startWatchdog();
}

void KorvelRecognizer::leaveEngine() {
    exceptionWatch.reset();
    getEngine()->unregisterRecognizer(this);
}

bool KorvelRecognizer::statusIsReasonable(const Settings& engineSettings, std::string& obstacle) {
    const int reachability = Network::NetworkManager::getInstance().getReachability();
    if (engineSettings.getUrl().empty()) {
        obstacle = "the engine's setting \"url\" is empty";
    } else if (engineSettings.getUuid().empty()) {
        obstacle = "the engine's setting \"uuid\" is empty";
    } else if (reachability == Network::NetworkManager::UNREACHABLE) {
        obstacle = "there is no network";
    } else {
        return true;
    }
    kdLogFormatMessage("KorvelRecognizer: uuid %s, url %s, reachability %d; failing",
                       engineSettings.getUuid().c_str(), engineSettings.getUrl().c_str(),
                       reachability);
    return false;
}

void KorvelRecognizer::chooseSessionMode(const Settings& engineSettings) {
    const std::string& mode = engineSettings.getString(Settings::SKS_SESSION_MODE);
    if (mode == Settings::SESSION_MODE_GENERAL) {
        sessionMode = Sound::Recorder::MODE_GENERAL;
    } else if (mode == Settings::SESSION_MODE_VOICE_RECOGNITION) {
        sessionMode = Sound::Recorder::MODE_VOICE_RECOGNITION;
    } else {
        kdLogFormatMessage("KorvelRecognizer: unknown session mode %s", mode.c_str());
    }
}

template <typename Ask>
bool KorvelRecognizer::callRecorder(SessionObserver::RecorderCall call, Ask ask) {
    observe([call](SessionObserver& watcher) { watcher.onRecorderCall(call); });
    const bool worked = ask();
    observe([&](SessionObserver& watcher) { watcher.onRecorderReturned(call, worked); });
    return worked;
}

bool KorvelRecognizer::startRecorder(int sampleRateHz) {
    const boost::shared_ptr<Sound::Recorder> starting = Sound::Recorder::createRecorder();
    starting->setMode(sessionMode);
    starting->addListener(boost::static_pointer_cast<KorvelRecognizer>(shared_from_this()));
    starting->setBufferLength(ListeningRules::BUFFER_LENGTH_MS);
    starting->setSampleRate(sampleRateHz);
    const bool works =
        callRecorder(SessionObserver::RecorderCall::INIT, [&] { return starting->init(); });
    if (isOver()) {
        return false;
    }
    if (!works) {
        recorderRefused = true;
        leaveEngine();
        reportError(SpeechError::ErrorAudio, "the recorder could not be started");
        return false;
    }
    recorder = starting;
    callRecorder(SessionObserver::RecorderCall::START, [&] {
        starting->startRecording();
        return true;
    });
    if (!recorder) {
        // It failed, or somebody stopped the session, before it had started. Without any sound that
        // is a failure, too.
        callRecorder(SessionObserver::RecorderCall::STOP, [&] {
            starting->stopRecording();
            return true;
        });
        stopWithError(SpeechError::ErrorAudio, "the recording ended before any sound came");
        return false;
    }
    return true;
}

void KorvelRecognizer::startProtocol(bool streaming) {
    protocol = RecognizeProtocol::create(this, streaming ? "chunked" : "simple");
    protocol->setObserver(observer);
    protocol->addListener(boost::static_pointer_cast<KorvelRecognizer>(shared_from_this()));
}

void KorvelRecognizer::startDetector(const std::string& parameters,
                                     const Sound::SoundDataInfo& format) {
    vad = VoiceActivityDetector::create(parameters);
    vad->setSoundDataInfo(format);
    vad->setSessionMode(sessionMode);
    vad->start();
    leadingNoiseMs = static_cast<unsigned>(vad->getLeadingNoiseMS());
}

void KorvelRecognizer::startDump(const Sound::SoundDataInfo& format) {
    wavDump = boost::make_shared<Util::WavOutputStream>();
    if (!wavDump->init(DUMP_PATH, format)) {
        wavDump.reset();
    }
}

void KorvelRecognizer::startWatchdog() {
    lastSoundTime = startTime;
    watchdog = boost::make_shared<Util::Timer>([this] { enter([this] { checkRecorder(); }); });
    watchdog->start(KD_TIMER_PERIODIC_AVERAGE, NO_SOUND_LIMIT_NS);
}

void KorvelRecognizer::checkRecorder() {
    const int64_t now = kdGetTimeUST();
    const bool isSilent = now - lastSoundTime >= NO_SOUND_LIMIT_NS;
    if (recorder && (isSilent || now - startTime >= LISTENING_LIMIT_NS)) {
        kdLogFormatMessage("KorvelRecognizer: the recorder delivers %s",
                           isSilent ? "nothing" : "too little");
        stopWithError(SpeechError::ErrorAudio,
                      isSilent ? "the recorder delivered no sound for 10 s"
                               : "the recorder delivered less than 20 s of sound in 60 s");
    }
}

void KorvelRecognizer::onRecorderDataReceived(
    Sound::Recorder* /*source*/, boost::shared_ptr<const Sound::SoundDataBuffer> buffer) {
    enter([this, &buffer] { take(buffer); });
}

void KorvelRecognizer::take(const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer) {
    if (!isListening()) {
        return;
    }
    // Read once: what follows from this buffer depends on its arrival alone.
    const int64_t arrival = kdGetTimeUST();
    observe([&](SessionObserver& watcher) { watcher.onBuffer(arrival, *buffer); });
    if (wavDump) {
        wavDump->write(buffer->getData().data(), static_cast<int>(buffer->getData().size()));
    }
    const unsigned durationMs = ListeningRules::getDurationMs(*buffer);
    recordedMs += durationMs;
    lastSoundTime = durationMs > 0 ? arrival : lastSoundTime;
    const boost::shared_ptr<RecognizeProtocol> receiver = protocol;
    receiver->handle(buffer);
    if (!isListening()) {
        return;
    }
    if (!leadingNoiseDone) {
        learnLeadingNoise(*buffer, arrival);
        return;
    }
    powerEstimator.updatePower(*buffer);
    reportSound(*buffer);
    // A listener may have ended listening or the whole session.
    if (isListening()) {
        detectVoice(*buffer, arrival);
    }
}

template <typename Call>
void KorvelRecognizer::announce(ObservedEvent::Kind kind, Call call) {
    if (isOver()) {
        return;
    }
    const EventMark mark(observer, {kind});
    listeners.notify([this, &call](RecognizerListener& listener) {
        if (!isOver()) {
            call(listener);
        }
    });
}

void KorvelRecognizer::learnLeadingNoise(const Sound::SoundDataBuffer& buffer, int64_t arrival) {
    powerEstimator.learnNoise(buffer);
    vad->processNoise(buffer);
    observe([this](SessionObserver& watcher) {
        watcher.onNoise(powerEstimator.getNoiseLevel(), vad->getNoiseRow());
    });
    if (ListeningRules::isNoiseLearned(arrival - startTime, leadingNoiseMs)) {
        leadingNoiseDone = true;
        announce(ObservedEvent::RECORDING_BEGIN,
                 [this](RecognizerListener& listener) { listener.onRecordingBegin(this); });
    }
}

template <typename Call>
void KorvelRecognizer::reportWhileListening(const ObservedEvent& event, Call call) {
    if (!isListening()) {
        return;
    }
    const EventMark mark(observer, event);
    listeners.notify([this, &call](RecognizerListener& listener) {
        if (isListening()) {
            call(listener);
        }
    });
}

void KorvelRecognizer::reportSound(const Sound::SoundDataBuffer& buffer) {
    reportWhileListening(
        {ObservedEvent::BUFFER_RECEIVED},
        [this, &buffer](RecognizerListener& listener) { listener.onBufferReceived(this, buffer); });
    ObservedEvent change{ObservedEvent::POWER_CHANGED};
    change.levelDb = powerEstimator.getLevel();
    reportWhileListening(change, [this](RecognizerListener& listener) {
        listener.onPowerChanged(this, powerEstimator.getLevel());
    });
}

void KorvelRecognizer::detectVoice(const Sound::SoundDataBuffer& buffer, int64_t arrival) {
    const bool wasSpeech = vad->isSpeech();
    vad->process(buffer);
    if (observer && wasSpeech != vad->isSpeech()) {
        observer->onDetector(!wasSpeech, vad->getLatestActivity());
    }
    switch (ListeningRules::decide(wasSpeech, vad->isSpeech(), recordedMs, arrival - startTime)) {
        case ListeningStep::LISTENING_ENDS:
            sendWhatWasHeard();
            return;
        case ListeningStep::NO_VOICE:
            fail(SpeechError::ErrorNoVoice, "no speech within 5 s");
            return;
        case ListeningStep::SPEECH_BEGINS:
            onProtocolVoiceBegin();
            return;
        case ListeningStep::RECORDING_BEGINS:
        case ListeningStep::GO_ON:
            return;
    }
}

void KorvelRecognizer::stop() {
    enter([this] {
        observe([](SessionObserver& watcher) { watcher.onCall(SessionObserver::Call::STOP); });
        sendWhatWasHeard();
    });
}

void KorvelRecognizer::sendWhatWasHeard() {
    stopRecorder();
    if (protocol) {
        const boost::shared_ptr<RecognizeProtocol> sending = protocol;
        sending->sendRequest();
    }
}

void KorvelRecognizer::cancel() {
    enter([this] {
        observe([](SessionObserver& watcher) { watcher.onCall(SessionObserver::Call::CANCEL); });
        stopWithError(SpeechError::ErrorCanceled, "the application cancelled");
    });
}

void KorvelRecognizer::stopRecorder() {
    // Forgotten first: while it is being stopped, a recorder may deliver or fail once more.
    if (const boost::shared_ptr<Sound::Recorder> stopped = std::move(recorder)) {
        callRecorder(SessionObserver::RecorderCall::STOP, [&] {
            stopped->stopRecording();
            return true;
        });
    }
}

void KorvelRecognizer::stopListening() {
    wavDump.reset();
    watchdog.reset();
    listeningStoppedTime = kdGetTimeUST();
    stopRecorder();
}

void KorvelRecognizer::dropProtocol() {
    if (protocol) {
        protocol->abandon();
        protocol.reset();
    }
}

void KorvelRecognizer::stopWithError(SpeechError error, std::string_view reason) {
    const boost::shared_ptr<Recognizer> self = shared_from_this();
    if (recorder || watchdog) {
        stopListening();
    }
    dropProtocol();
    if (!isOver()) {
        errorReported = true;
        leaveEngine();
        reportError(error, reason);
    }
}

void KorvelRecognizer::reportError(SpeechError error, std::string_view reason) {
    ObservedEvent event{ObservedEvent::ERROR};
    event.errorCode = error.getCode();
    event.reason = reason;
    const EventMark mark(observer, event);
    callOnError(error, reason);
}

void KorvelRecognizer::onRecorderError(Sound::Recorder* /*source*/) {
    enter([this] {
        observe([](SessionObserver& watcher) { watcher.onRecorderError(); });
        stopWithError(SpeechError::ErrorAudio, "the recorder failed");
    });
}

void KorvelRecognizer::onProtocolVoiceBegin() {
    const boost::shared_ptr<Recognizer> self = shared_from_this();
    announce(ObservedEvent::SPEAKING_BEGIN,
             [this](RecognizerListener& listener) { listener.onSpeakingBegin(this); });
}

void KorvelRecognizer::onProtocolVoiceCaptured() {
    const boost::shared_ptr<Recognizer> self = shared_from_this();
    if (!isOver()) {
        stopListening();
        announce(ObservedEvent::RECORDING_DONE,
                 [this](RecognizerListener& listener) { listener.onRecordingDone(this); });
    }
}

void KorvelRecognizer::onProtocolResults(boost::shared_ptr<const RecognitionResults> results,
                                         const std::string& requestId) {
    const boost::shared_ptr<Recognizer> self = shared_from_this();
    if (isOver()) {
        return;
    }
    // From here on nothing else is the end, not even a recorder that fails while it is stopped.
    resultsReported = true;
    // The service may answer a streamed request before the user has finished.
    if (recorder || watchdog) {
        stopListening();
    }
    tvLogFormatMessage(LOG_LEVEL, "Request %s finished in %d msec", requestId.c_str(),
                       static_cast<int>((kdGetTimeUST() - listeningStoppedTime) / NS_PER_MS));
    dropProtocol();
    leaveEngine();
    reportResults(results, requestId);
}

void KorvelRecognizer::reportResults(const boost::shared_ptr<const RecognitionResults>& results,
                                     const std::string& requestId) {
    if (!observer || !results) {
        callOnResults(results, requestId);
        return;
    }
    const Recognition recognition(
        Recognition::decideOutcome(*results, *getEngine()->getTalvoxSettings()), results,
        requestId);
    ObservedEvent event{ObservedEvent::RESULTS};
    event.recognition = &recognition;
    const EventMark mark(observer, event);
    callOnResults(results, requestId);
}

void KorvelRecognizer::onProtocolError(SpeechError error) {
    const boost::shared_ptr<RecognizeProtocol> failed = protocol;
    if (!isOver()) {
        setErrorStatus(failed ? failed->getErrorStatus() : std::nullopt);
    }
    fail(error, failed ? std::string_view(failed->getErrorReason()) : std::string_view());
}

void KorvelRecognizer::fail(SpeechError error, std::string_view reason) {
    const boost::shared_ptr<Recognizer> self = shared_from_this();
    if (isOver()) {
        return;
    }
    if (listeningStoppedTime != 0) {
        tvLogFormatMessage(LOG_LEVEL, "Request failed in %d msec",
                           static_cast<int>((kdGetTimeUST() - listeningStoppedTime) / NS_PER_MS));
    }
    stopListening();
    stopWithError(error, reason);
}

}  // namespace Talvox
