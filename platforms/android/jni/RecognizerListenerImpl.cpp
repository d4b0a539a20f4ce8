#include "RecognizerListenerImpl.h"

#include <exception>
#include <optional>

#include "Env.h"
#include "Text.h"
#include "pal/kd_jni.h"
#include "pal/kd_log.h"

namespace {

/** References that an event needs besides those of its hypotheses; of these one lives at a time. */
const jint FRAME_SIZE = 10;

const char* const DETAIL_METHOD = "onErrorDetail";

Jni::LocalRef<jobjectArray> makeTexts(JNIEnv* env, const Talvox::RecognitionResults& results) {
    std::vector<std::string> texts;
    for (std::size_t index = 0; index < results.size(); ++index) {
        texts.push_back(results.at(index).getText());
    }
    return Jni::toJStrings(env, texts);
}

Jni::LocalRef<jfloatArray> makeConfidences(JNIEnv* env, const Talvox::RecognitionResults& results) {
    std::vector<jfloat> values;
    for (std::size_t index = 0; index < results.size(); ++index) {
        values.push_back(results.at(index).getConfidence());
    }
    const auto count = static_cast<jsize>(values.size());
    Jni::LocalRef<jfloatArray> array(env, env->NewFloatArray(count));
    Jni::check(env);
    env->SetFloatArrayRegion(array.get(), 0, count, values.data());
    Jni::check(env);
    return array;
}

/** Null without a number. */
Jni::LocalRef<jobject> makeInteger(JNIEnv* env, std::optional<int> number) {
    if (!number) {
        return Jni::LocalRef<jobject>(env, nullptr);
    }
    const Jni::LocalRef<jclass> type = Jni::findClass(env, "java/lang/Integer");
    return Jni::newObject(env, type.get(), "(I)V", static_cast<jint>(*number));
}

}  // namespace

RecognizerListenerImpl::~RecognizerListenerImpl() = default;

void RecognizerListenerImpl::attach(JNIEnv* env, jobject object) {
    const Jni::LocalRef<jclass> type(env, env->GetObjectClass(object));
    javaObject = Jni::GlobalRef(env, object);
    javaClass = Jni::GlobalRef(env, type.get());
}

void RecognizerListenerImpl::detach() {
    javaObject.reset();
    javaClass.reset();
}

template <typename Event>
void RecognizerListenerImpl::deliver(const char* name, jint localReferences, Event event) {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr || !javaObject) {
        return;
    }
    try {
        const Jni::LocalFrame frame(env, localReferences, FRAME_SIZE);
        event(env);
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, name);
    } catch (const std::exception& failure) {
        kdLogFormatMessage("%s is lost: %s", name, failure.what());
    }
}

template <typename... Args>
void RecognizerListenerImpl::callJava(JNIEnv* env, const char* name, const char* signature,
                                      Args... args) {
    const jmethodID method = Jni::findMethod(env, javaClass.getClass(), name, signature);
    env->CallNonvirtualVoidMethod(javaObject.get(), javaClass.getClass(), method, args...);
    Jni::check(env);
}

void RecognizerListenerImpl::onRecordingBegin(Talvox::Recognizer* /*source*/) {
    deliver("onRecordingBegin", FRAME_SIZE,
            [this](JNIEnv* env) { callJava(env, "onRecordingBegin", "()V"); });
}

void RecognizerListenerImpl::onSpeakingBegin(Talvox::Recognizer* /*source*/) {
    deliver("onSpeakingBegin", FRAME_SIZE,
            [this](JNIEnv* env) { callJava(env, "onSpeakingBegin", "()V"); });
}

void RecognizerListenerImpl::onRecordingDone(Talvox::Recognizer* /*source*/) {
    deliver("onRecordingDone", FRAME_SIZE,
            [this](JNIEnv* env) { callJava(env, "onRecordingDone", "()V"); });
}

void RecognizerListenerImpl::onBufferReceived(Talvox::Recognizer* /*source*/,
                                              const Sound::SoundDataBuffer& buffer) {
    deliver("onBufferReceived", FRAME_SIZE, [this, &buffer](JNIEnv* env) {
        const std::vector<unsigned char>& data = buffer.getData();
        const auto size = static_cast<jsize>(data.size());
        const Jni::LocalRef<jbyteArray> bytes(env, env->NewByteArray(size));
        Jni::check(env);
        env->SetByteArrayRegion(bytes.get(), 0, size, reinterpret_cast<const jbyte*>(data.data()));
        Jni::check(env);
        callJava(env, "onBufferReceived", "([B)V", bytes.get());
    });
}

void RecognizerListenerImpl::onPowerChanged(Talvox::Recognizer* /*source*/, float power) {
    deliver("onPowerChanged", FRAME_SIZE, [this, power](JNIEnv* env) {
        callJava(env, "onPowerChanged", "(F)V", static_cast<jfloat>(power));
    });
}

void RecognizerListenerImpl::onResults(Talvox::Recognizer* source,
                                       boost::shared_ptr<Talvox::Recognition> recognition) {
    const Talvox::RecognitionResults& results = *recognition->getResults();
    bool isMade = false;
    deliver("onResults", static_cast<jint>(results.size()) + FRAME_SIZE, [&](JNIEnv* env) {
        const Jni::LocalRef<jobjectArray> texts = makeTexts(env, results);
        const Jni::LocalRef<jfloatArray> confidences = makeConfidences(env, results);
        const Jni::LocalRef<jstring> request = Jni::toJString(env, recognition->getRequestId());
        isMade = true;
        callJava(env, "onResults", "(I[Ljava/lang/String;[FLjava/lang/String;)V",
                 static_cast<jint>(recognition->getOutcome()), texts.get(), confidences.get(),
                 request.get());
    });
    if (!isMade && javaObject) {
        kdLogFormatMessage("onResults: no room for %d hypotheses in Java, reporting ErrorUnknown",
                           static_cast<int>(results.size()));
        onError(source, Talvox::SpeechError::ErrorUnknown);
    }
}

void RecognizerListenerImpl::reportDetail(const Talvox::Recognizer& source) {
    deliver(DETAIL_METHOD, FRAME_SIZE, [this, &source](JNIEnv* env) {
        const jmethodID method =
            env->GetMethodID(javaClass.getClass(), DETAIL_METHOD,
                             "(Ljava/lang/String;Ljava/lang/Integer;Ljava/lang/Integer;)V");
        if (method == nullptr) {
            env->ExceptionClear();
            return;
        }
        const Jni::LocalRef<jstring> reason = Jni::toJString(env, source.getErrorReason());
        const Jni::LocalRef<jobject> status = makeInteger(env, source.getErrorStatus());
        const Jni::LocalRef<jobject> number = makeInteger(env, source.getDeviceError());
        env->CallNonvirtualVoidMethod(javaObject.get(), javaClass.getClass(), method, reason.get(),
                                      status.get(), number.get());
        Jni::check(env);
    });
}

void RecognizerListenerImpl::onError(Talvox::Recognizer* source, Talvox::SpeechError error) {
    reportDetail(*source);
    deliver("onError", FRAME_SIZE, [this, error](JNIEnv* env) {
        callJava(env, "onError", "(I)V", static_cast<jint>(error.getCode()));
    });
}
