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
    watchdog.reset();
    try {
        stopRecorder();
        dropProtocol();
    } catch (const std::exception& exception) {
        kdLogFormatMessage("KorvelRecognizer: an exception at the end: %s", exception.what());
    }
    wavDump.reset();
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
    if (!getEngine()->registerRecognizer(this)) {
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
    startProtocol(engineSettings->getBoolean(Settings::SKS_STREAMING));
    startDetector(engineSettings->getString(Settings::SKS_VAD_SETTINGS), format);
    startTime = kdGetTimeUST();
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

bool KorvelRecognizer::startRecorder(int sampleRateHz) {
    const boost::shared_ptr<Sound::Recorder> starting = Sound::Recorder::createRecorder();
    starting->setMode(sessionMode);
    starting->addListener(boost::static_pointer_cast<KorvelRecognizer>(shared_from_this()));
    starting->setBufferLength(ListeningRules::BUFFER_LENGTH_MS);
    starting->setSampleRate(sampleRateHz);
    const bool works = starting->init();
    if (isOver()) {
        return false;
    }
    if (!works) {
        recorderRefused = true;
        leaveEngine();
        callOnError(SpeechError::ErrorAudio, "the recorder could not be started");
        return false;
    }
    recorder = starting;
    starting->startRecording();
    if (!recorder) {
        // It failed, or somebody stopped the session, before it had started. Without any sound that
        // is a failure, too.
        starting->stopRecording();
        stopWithError(SpeechError::ErrorAudio, "the recording ended before any sound came");
        return false;
    }
    return true;
}

void KorvelRecognizer::startProtocol(bool streaming) {
    protocol = RecognizeProtocol::create(this, streaming ? "chunked" : "simple");
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
    if (wavDump) {
        wavDump->write(buffer->getData().data(), static_cast<int>(buffer->getData().size()));
    }
    const unsigned durationMs = ListeningRules::getDurationMs(*buffer);
    recordedMs += durationMs;
    lastSoundTime = durationMs > 0 ? kdGetTimeUST() : lastSoundTime;
    const boost::shared_ptr<RecognizeProtocol> receiver = protocol;
    receiver->handle(buffer);
    if (!isListening()) {
        return;
    }
    if (!leadingNoiseDone) {
        learnLeadingNoise(*buffer);
        return;
    }
    powerEstimator.updatePower(*buffer);
    reportSound(*buffer);
    // A listener may have ended listening or the whole session.
    if (isListening()) {
        detectVoice(*buffer);
    }
}

template <typename Call>
void KorvelRecognizer::announce(Call call) {
    listeners.notify([this, &call](RecognizerListener& listener) {
        if (!isOver()) {
            call(listener);
        }
    });
}

void KorvelRecognizer::learnLeadingNoise(const Sound::SoundDataBuffer& buffer) {
    powerEstimator.learnNoise(buffer);
    vad->processNoise(buffer);
    if (ListeningRules::isNoiseLearned(kdGetTimeUST() - startTime, leadingNoiseMs)) {
        leadingNoiseDone = true;
        announce([this](RecognizerListener& listener) { listener.onRecordingBegin(this); });
    }
}

void KorvelRecognizer::reportSound(const Sound::SoundDataBuffer& buffer) {
    listeners.notify([this, &buffer](RecognizerListener& listener) {
        if (isListening()) {
            listener.onBufferReceived(this, buffer);
        }
    });
    listeners.notify([this](RecognizerListener& listener) {
        if (isListening()) {
            listener.onPowerChanged(this, powerEstimator.getLevel());
        }
    });
}

void KorvelRecognizer::detectVoice(const Sound::SoundDataBuffer& buffer) {
    const bool wasSpeech = vad->isSpeech();
    vad->process(buffer);
    switch (ListeningRules::decide(wasSpeech, vad->isSpeech(), recordedMs,
                                   kdGetTimeUST() - startTime)) {
        case ListeningStep::LISTENING_ENDS:
            stop();
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
        stopRecorder();
        if (protocol) {
            const boost::shared_ptr<RecognizeProtocol> sending = protocol;
            sending->sendRequest();
        }
    });
}

void KorvelRecognizer::cancel() {
    enter([this] { stopWithError(SpeechError::ErrorCanceled, "the application cancelled"); });
}

void KorvelRecognizer::stopRecorder() {
    // Forgotten first: while it is being stopped, a recorder may deliver or fail once more.
    if (const boost::shared_ptr<Sound::Recorder> stopped = std::move(recorder)) {
        stopped->stopRecording();
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
        callOnError(error, reason);
    }
}

void KorvelRecognizer::onRecorderError(Sound::Recorder* /*source*/) {
    enter([this] { stopWithError(SpeechError::ErrorAudio, "the recorder failed"); });
}

void KorvelRecognizer::onProtocolVoiceBegin() {
    const boost::shared_ptr<Recognizer> self = shared_from_this();
    announce([this](RecognizerListener& listener) { listener.onSpeakingBegin(this); });
}

void KorvelRecognizer::onProtocolVoiceCaptured() {
    const boost::shared_ptr<Recognizer> self = shared_from_this();
    if (!isOver()) {
        stopListening();
        announce([this](RecognizerListener& listener) { listener.onRecordingDone(this); });
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
