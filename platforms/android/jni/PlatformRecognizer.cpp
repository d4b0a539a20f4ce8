#include "PlatformRecognizer.h"

#include <boost/make_shared.hpp>
#include <exception>
#include <utility>

#include "BundleConversion.h"
#include "Env.h"
#include "Handles.h"
#include "SelfFinishingTaskHolder.h"
#include "Text.h"
#include "core/network/NetworkManager.h"
#include "core/sound/OggSpeexEncoder.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "pal/kd_jni.h"
#include "talvox/Log.h"
#include "talvox/Talvox.h"
#include "talvox/impl/RecognizeRequest.h"
#include "talvox/impl/RequestFormat.h"

using Talvox::RecognitionResults;
using Talvox::RecognizerListener;
using Talvox::Settings;
using Talvox::SpeechError;

namespace {

const char* const JAVA_CLASS = "korvel/talvox/impl/PlatformRecognizer";
const char* const ASSERT_PATH = "platforms/android/jni/PlatformRecognizer";

const int LOG_LEVEL = 2;
const int SAMPLE_RATE_HZ = 8000;
const int BYTES_PER_SAMPLE = 2;
const int64_t NS_PER_MS = 1000000;
const int64_t SILENCE_LIMIT_NS = 30000 * NS_PER_MS;
const int64_t ANSWER_LIMIT_NS = 20000 * NS_PER_MS;
const int NO_HYPOTHESIS = -1;

Sound::SoundDataInfo makeSoundFormat() {
    return {Sound::SoundDataInfo::NONE, 1, SAMPLE_RATE_HZ, BYTES_PER_SAMPLE, 0};
}

std::vector<std::string> readLanguages(JNIEnv* env) {
    const Jni::LocalRef<jclass> type = Jni::findClass(env, JAVA_CLASS);
    const Jni::LocalRef<jobject> list =
        Jni::callStaticObject(env, type.get(), "getAvailableLanguages", "()Ljava/util/ArrayList;");
    std::vector<std::string> languages;
    const jint count = list ? Jni::callInt(env, list.get(), "size", "()I") : 0;
    int ignored = 0;
    for (jint index = 0; index < count; ++index) {
        Jni::LocalRef<jobject> tag =
            Jni::callObject(env, list.get(), "get", "(I)Ljava/lang/Object;", index);
        if (Jni::isText(env, tag.get())) {
            languages.push_back(Jni::toUtf8(env, std::move(tag).as<jstring>().get()));
        } else {
            ++ignored;
        }
    }
    if (ignored > 0) {
        kdLogFormatMessage("PlatformRecognizer: %d of %d languages are not texts, ignored", ignored,
                           static_cast<int>(count));
    }
    return languages;
}

bool askAvailability(JNIEnv* env) {
    const Jni::LocalRef<jclass> recognizer = Jni::findClass(env, "android/speech/SpeechRecognizer");
    const jmethodID isAvailable = Jni::findStaticMethod(
        env, recognizer.get(), "isRecognitionAvailable", "(Landroid/content/Context;)Z");
    const Jni::LocalRef<jclass> application = Jni::findClass(env, "korvel/core/CoreApplication");
    const Jni::LocalRef<jobject> context = Jni::callStaticObject(
        env, application.get(), "getApplicationContext", "()Landroid/content/Context;");
    if (!context) {
        return false;
    }
    const jboolean answer =
        env->CallStaticBooleanMethod(recognizer.get(), isAvailable, context.get());
    Jni::check(env);
    return answer != JNI_FALSE;
}

}  // namespace

PlatformRecognizer::PlatformRecognizer(const Talvox::Talvox* facade,
                                       boost::shared_ptr<const Settings> recognizerSettings)
    : Recognizer(facade, std::move(recognizerSettings)) {
    chooseLogging();
}

boost::shared_ptr<PlatformRecognizer> PlatformRecognizer::create(
    const Talvox::Talvox* facade, const boost::shared_ptr<const Settings>& settings) {
    auto recognizer = boost::allocate_shared<PlatformRecognizer>(
        Jni::QuarantineAllocator<PlatformRecognizer>(), facade, settings);
    Jni::KnownObjects<PlatformRecognizer>::add(recognizer);
    return recognizer;
}

PlatformRecognizer::~PlatformRecognizer() {
    const Util::EventLock lock;
    Jni::KnownObjects<PlatformRecognizer>::remove(this);
    cancelSilently();
    leaveEngine();
}

// The last reference may be going on another thread; then there is nothing to end.
void PlatformRecognizer::onException(const char* what) {
    const boost::shared_ptr<Recognizer> self = weak_from_this().lock();
    if (self && !over) {
        Talvox::endSession(what, [this](const char* text) { endUnexpectedly(text); });
    }
}

void PlatformRecognizer::endUnexpectedly(const char* what) {
    if (JNIEnv* const env = kdGetJNIEnvKOR()) {
        Jni::logAndClear(env, "PlatformRecognizer");
    }
    if (pendingResults) {
        reportResults();
    } else {
        giveUp(SpeechError::ErrorUnknown, what);
    }
}

void PlatformRecognizer::leaveEngine() {
    exceptionWatch.reset();
    getEngine()->unregisterRecognizer(this);
}

void PlatformRecognizer::chooseLogging() {
    const std::string& policy = getSettings()->getString(Settings::SKS_LOGGING_POLICY);
    const bool isWifi =
        Network::NetworkManager::getInstance().getReachability() == Network::NetworkManager::WIFI;
    if (policy == Settings::LOG_WITH_SOUND_ALWAYS) {
        loggingEnabled = true;
        logWithSound = true;
    } else if (policy == Settings::LOG_WITH_SOUND_IF_WIFI) {
        loggingEnabled = true;
        logWithSound = isWifi;
    } else if (policy == Settings::LOG_WITHOUT_SOUND_ALWAYS) {
        loggingEnabled = true;
    } else if (policy != Settings::LOG_DISABLED) {
        kdLogFormatMessage("PlatformRecognizer: unknown value for loggingPolicy: %s",
                           policy.c_str());
    }
    if (logWithSound) {
        prepareSound(isWifi);
    }
}

void PlatformRecognizer::prepareSound(bool isWifi) {
    const std::string& format = getSettings()->getString(Settings::SKS_SOUND_FORMAT);
    encodeWithSpeex = format == Settings::SOUND_FORMAT_SPEEX ||
                      (format == Settings::SOUND_FORMAT_PCM_IF_WIFI && !isWifi);
    if (!encodeWithSpeex) {
        pcmBuffer = boost::make_shared<Sound::SoundDataBuffer>(makeSoundFormat());
        return;
    }
    encoder = boost::make_shared<Talvox::ParallelEncoder>(
        boost::make_shared<Sound::OggSpeexEncoder>(
            makeSoundFormat(), getSettings()->getInt(Settings::SKS_SPEEX_QUALITY)),
        [this](const boost::shared_ptr<const Sound::SoundDataBuffer>& sound) {
            makeHttpRequest(sound);
        });
}

void PlatformRecognizer::start() {
    enter([this] { begin(); });
}

void PlatformRecognizer::begin() {
    if (over || jobj) {
        kdLogFormatMessage("PlatformRecognizer: a recognizer is started once, start is ignored");
        return;
    }
    if (!Talvox::Talvox::getInstance().registerRecognizer(this)) {
        endWithError(SpeechError::ErrorBusy, "another session is active");
        return;
    }
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr) {
        endWithError(SpeechError::ErrorNotAvailable, "there is no Java VM");
        return;
    }
    if (kdStartEventsKOR() != 0) {
        endWithError(SpeechError::ErrorUnknown, Talvox::NO_THREAD_REASON);
        return;
    }
    exceptionWatch.emplace(static_cast<Talvox::ExceptionWatch::Owner&>(*this));
    hear();
    silenceTimer = std::make_unique<Util::Timer>([this] { enter([this] { checkSilence(); }); });
    silenceTimer->start(KD_TIMER_ONESHOT, SILENCE_LIMIT_NS);
    startJavaObject(env);
}

void PlatformRecognizer::startJavaObject(JNIEnv* env) {
    try {
        createJavaObject();
        if (!over) {
            Jni::callVoid(env, jobj.get(), "start", "()V");
        }
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, "PlatformRecognizer.start");
        // A listener may have cancelled meanwhile.
        KOR_ASSERT_AT(jobj || over, "jobj", ASSERT_PATH, __LINE__);
        endWithError(SpeechError::ErrorNotAvailable, "the device recognizer could not be started");
    }
}

void PlatformRecognizer::createJavaObject() {
    JNIEnv* const env = Jni::getEnv();
    const Jni::LocalRef<jclass> type = Jni::findClass(env, JAVA_CLASS);
    const Jni::LocalRef<jobject> bundle(env, bundleToJBundle(*getSettings()));
    const Jni::LocalRef<jobject> object = Jni::newObject(env, type.get(), "(JLandroid/os/Bundle;)V",
                                                         Jni::toHandle(this), bundle.get());
    jobj = Jni::GlobalRef(env, object.get());
}

void PlatformRecognizer::stop() {
    enter([this] {
        requestTime = kdGetTimeUST();
        JNIEnv* const env = kdGetJNIEnvKOR();
        if (!jobj || env == nullptr) {
            return;
        }
        awaitAnswer();
        try {
            Jni::callVoid(env, jobj.get(), "stop", "()V");
        } catch (const Jni::PendingException&) {
            Jni::logAndClear(env, "PlatformRecognizer.stop");
            if (!pendingResults) {
                giveUp(SpeechError::ErrorUnknown, "the device recognizer could not be stopped");
            }
        }
    });
}

void PlatformRecognizer::cancel() {
    enter([this] { giveUp(SpeechError::ErrorCanceled, "the application cancelled"); });
}

void PlatformRecognizer::giveUp(int code, std::string_view reason) {
    // What Java says while it is cancelled does not count.
    const bool wasOver = std::exchange(over, true);
    cancelSilently();
    if (!wasOver) {
        reportError(code, reason);
    }
}

void PlatformRecognizer::cancelSilently() {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (!jobj || env == nullptr) {
        return;
    }
    // Java may call back from inside.
    const Jni::GlobalRef object = std::move(jobj);
    try {
        Jni::callVoid(env, object.get(), "cancel", "()V");
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, "PlatformRecognizer.cancel");
    }
}

void PlatformRecognizer::endWithError(int code, std::string_view reason) {
    if (!std::exchange(over, true)) {
        reportError(code, reason);
    }
}

void PlatformRecognizer::reportError(int code, std::string_view reason) {
    encoder.reset();
    silenceTimer.reset();
    leaveEngine();
    callOnError(SpeechError(code), reason);
}

bool PlatformRecognizer::isRecognitionAvailable() {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr) {
        return false;
    }
    try {
        return askAvailability(env);
    } catch (const Jni::PendingException&) {
        env->ExceptionClear();
        return false;
    }
}

const std::vector<std::string>& PlatformRecognizer::getAvailableLanguages() {
    static std::vector<std::string> languages;
    if (JNIEnv* const env = kdGetJNIEnvKOR()) {
        try {
            languages = readLanguages(env);
        } catch (const Jni::PendingException&) {
            env->ExceptionClear();
        }
    }
    return languages;
}

template <typename Call>
void PlatformRecognizer::announce(Call call) {
    enter([&] {
        hear();
        listeners.notify([&](RecognizerListener& listener) {
            if (!over) {
                call(listener);
            }
        });
    });
}

void PlatformRecognizer::hear() {
    if (!answerAwaited) {
        silenceDeadline = kdGetTimeUST() + SILENCE_LIMIT_NS;
    }
}

void PlatformRecognizer::awaitAnswer() {
    if (!silenceTimer || answerAwaited) {
        return;
    }
    answerAwaited = true;
    silenceDeadline = kdGetTimeUST() + ANSWER_LIMIT_NS;
    silenceTimer->start(KD_TIMER_ONESHOT, ANSWER_LIMIT_NS);
}

void PlatformRecognizer::checkSilence() {
    const int64_t leftNs = silenceDeadline - kdGetTimeUST();
    if (leftNs > 0) {
        silenceTimer->start(KD_TIMER_ONESHOT, leftNs);
        return;
    }
    giveUp(SpeechError::ErrorNetwork, answerAwaited
                                          ? "no answer of the device recognizer within 20 s"
                                          : "no callback of the device recognizer for 30 s");
}

void PlatformRecognizer::onReadyForSpeech() {
    announce([this](RecognizerListener& listener) { listener.onRecordingBegin(this); });
}

void PlatformRecognizer::onBeginningOfSpeech() {
    announce([this](RecognizerListener& listener) { listener.onSpeakingBegin(this); });
}

void PlatformRecognizer::onRmsChanged(float rms) {
    announce([this, rms](RecognizerListener& listener) { listener.onPowerChanged(this, rms); });
}

void PlatformRecognizer::onBufferReceived(const char* data, unsigned size) {
    enter([this, data, size] { takeSound(data, size); });
}

void PlatformRecognizer::takeSound(const char* data, unsigned size) {
    hear();
    if (!logWithSound || over || pendingResults) {
        return;
    }
    const auto* const bytes = reinterpret_cast<const unsigned char*>(data);
    if (encodeWithSpeex) {
        encoder->write(boost::make_shared<const Sound::SoundDataBuffer>(
            makeSoundFormat(), std::vector<unsigned char>(bytes, bytes + size)));
        return;
    }
    std::vector<unsigned char>& sound = pcmBuffer->getData();
    sound.insert(sound.end(), bytes, bytes + size);
    Sound::SoundDataInfo& info = pcmBuffer->getInfo();
    info.setSampleCount(info.getSampleCount() + static_cast<int>(size / BYTES_PER_SAMPLE));
}

void PlatformRecognizer::onEndOfSpeech() {
    if (over) {
        return;
    }
    enter([this] {
        requestTime = kdGetTimeUST();
        awaitAnswer();
        announce([this](RecognizerListener& listener) { listener.onRecordingDone(this); });
    });
}

void PlatformRecognizer::onPartialResults(
    const boost::shared_ptr<const RecognitionResults>& /*results*/) {
    hear();
}

void PlatformRecognizer::onResults(const boost::shared_ptr<const RecognitionResults>& results) {
    if (over || pendingResults) {
        return;
    }
    enter([this, &results] {
        tvLogFormatMessage(LOG_LEVEL, "Request finished in %d msec", getMsSinceRequest());
        finishWithResults(results);
    });
}

void PlatformRecognizer::onError(int code) {
    if (!over && !pendingResults) {
        enter([this, code] { takeError(code); });
    }
}

void PlatformRecognizer::takeError(int code) {
    if (code == NO_HYPOTHESIS) {
        tvLogFormatMessage(LOG_LEVEL, "Request finished with empty results in %d msec",
                           getMsSinceRequest());
        finishWithResults(boost::make_shared<const RecognitionResults>());
        return;
    }
    if (requestTime != 0) {
        tvLogFormatMessage(LOG_LEVEL, "Request failed in %d msec", getMsSinceRequest());
    }
    if (code < 0 || code >= SpeechError::ErrorMax) {
        kdLogFormatMessage("PlatformRecognizer: %d is not an error code, reporting ErrorUnknown",
                           code);
        code = SpeechError::ErrorUnknown;
    }
    endWithDeviceError(code);
}

void PlatformRecognizer::endWithDeviceError(int code) {
    if (!over) {
        setDeviceError(causeNumber);
    }
    endWithError(code, causeReason);
}

void PlatformRecognizer::onErrorCause(std::optional<int> number, const std::string& reason) {
    if (!over && !pendingResults) {
        causeNumber = number;
        causeReason = reason;
    }
}

void PlatformRecognizer::onEvent() {
    hear();
}

int PlatformRecognizer::getMsSinceRequest() const {
    return static_cast<int>((kdGetTimeUST() - requestTime) / NS_PER_MS);
}

void PlatformRecognizer::finishWithResults(
    const boost::shared_ptr<const RecognitionResults>& results) {
    pendingResults = results;
    silenceTimer.reset();
    if (loggingEnabled && logWithSound && encodeWithSpeex) {
        encoder->closeWrite();
    } else {
        makeHttpRequest(pcmBuffer);
    }
}

void PlatformRecognizer::makeHttpRequest(
    const boost::shared_ptr<const Sound::SoundDataBuffer>& sound) {
    enter([this, &sound] {
        if (loggingEnabled && !over) {
            logSession(sound);
        }
        reportResults();
    });
}

// The upload may fail; the user gets the results.
void PlatformRecognizer::logSession(const boost::shared_ptr<const Sound::SoundDataBuffer>& sound) {
    try {
        submitLog(sound);
    } catch (const std::exception& exception) {
        kdLogFormatMessage("PlatformRecognizer: nothing is logged: %s", exception.what());
    }
}

void PlatformRecognizer::reportResults() {
    if (!std::exchange(over, true)) {
        leaveEngine();
        callOnResults(pendingResults, "");
    }
}

void PlatformRecognizer::submitLog(const boost::shared_ptr<const Sound::SoundDataBuffer>& sound) {
    Talvox::Talvox& facade = Talvox::Talvox::getInstance();
    const boost::shared_ptr<const Settings> engineSettings = facade.getTalvoxSettings();
    if (engineSettings->getUrl().empty() || engineSettings->getUuid().empty() ||
        getSettings()->getLanguage().empty()) {
        kdLogFormatMessage("PlatformRecognizer: no url, uuid or language; nothing is logged");
        return;
    }
    const auto request =
        boost::make_shared<Talvox::RecognizeRequest>(*engineSettings, *getSettings());
    const Sound::SoundDataInfo::Codec codec =
        encodeWithSpeex ? Sound::SoundDataInfo::SPEEX : Sound::SoundDataInfo::NONE;
    request->contentType =
        Talvox::makeContentType(Sound::SoundDataInfo(codec, 1, SAMPLE_RATE_HZ, BYTES_PER_SAMPLE));
    request->sound = sound;
    request->results = boost::make_shared<RecognitionResults>(*pendingResults);
    request->source = getSource();
    request->defaultLanguage = getLanguagePreference();
    request->topic = getModel();
    SelfFinishingTaskHolder::submitLog(facade, request);
}

std::string PlatformRecognizer::getModel() {
    return getStringProperty("getModel");
}

std::string PlatformRecognizer::getLanguagePreference() {
    return getStringProperty("getLanguagePreference");
}

std::string PlatformRecognizer::getSource() {
    return getStringProperty("getSource");
}

std::string PlatformRecognizer::getStringProperty(const char* methodName) {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (!KOR_ASSERT_AT(jobj, "jobj", ASSERT_PATH, __LINE__) || env == nullptr) {
        return {};
    }
    try {
        const Jni::LocalRef<jstring> text =
            Jni::callObject(env, jobj.get(), methodName, "()Ljava/lang/String;").as<jstring>();
        return Jni::toUtf8(env, text.get());
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, methodName);
        return {};
    }
}
