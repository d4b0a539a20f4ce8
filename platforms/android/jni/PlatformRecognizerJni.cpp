// Entry points of korvel.talvox.impl.PlatformRecognizer.
#include <boost/make_shared.hpp>
#include <vector>

#include "EntryPoint.h"
#include "Handles.h"
#include "PlatformRecognizer.h"
#include "Text.h"
#include "pal/kd_assert.h"

using Talvox::RecognitionResult;
using Talvox::RecognitionResults;

namespace {

const char* const ASSERT_PATH = "platforms/android/jni/PlatformRecognizer";
const char* const SAME_LENGTH =
    "!jconfidenceScores || ( jenv->GetArrayLength(strings) == "
    "jenv->GetArrayLength(jconfidenceScores))";

boost::shared_ptr<PlatformRecognizer> getRecognizer(JNIEnv* env, jlong handle) {
    return Jni::KnownObjects<PlatformRecognizer>::get(env, handle);
}

std::vector<jfloat> readScores(JNIEnv* env, jfloatArray scores) {
    std::vector<jfloat> values;
    if (scores != nullptr) {
        const jsize count = env->GetArrayLength(scores);
        values.resize(static_cast<std::size_t>(count));
        env->GetFloatArrayRegion(scores, 0, count, values.data());
        Jni::check(env);
    }
    return values;
}

boost::shared_ptr<const RecognitionResults> readResults(JNIEnv* env, jobjectArray strings,
                                                        jfloatArray jconfidenceScores) {
    Jni::requireNonNull(env, strings, "texts");
    const std::vector<jfloat> scores = readScores(env, jconfidenceScores);
    const jsize count = env->GetArrayLength(strings);
    KOR_ASSERT_AT(jconfidenceScores == nullptr || static_cast<std::size_t>(count) == scores.size(),
                  SAME_LENGTH, ASSERT_PATH, __LINE__);
    auto results = boost::make_shared<RecognitionResults>();
    for (jsize index = 0; index < count; ++index) {
        const Jni::LocalRef<jstring> text(
            env, static_cast<jstring>(env->GetObjectArrayElement(strings, index)));
        Jni::check(env);
        const auto position = static_cast<std::size_t>(index);
        results->emplace_back(
            Jni::toUtf8(env, text.get()),
            position < scores.size() ? scores[position] : RecognitionResult::UNKNOWN_CONFIDENCE);
    }
    return results;
}

void receiveBuffer(JNIEnv* env, PlatformRecognizer& recognizer, jbyteArray sound) {
    const jsize size = env->GetArrayLength(sound);
    std::vector<jbyte> bytes(static_cast<std::size_t>(size));
    env->GetByteArrayRegion(sound, 0, size, bytes.data());
    Jni::check(env);
    recognizer.onBufferReceived(reinterpret_cast<const char*>(bytes.data()),
                                static_cast<unsigned>(size));
}

}  // namespace

extern "C" {

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onReadyForSpeechInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer) {
    Jni::enter([recognizer](JNIEnv* env) { getRecognizer(env, recognizer)->onReadyForSpeech(); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onBeginningOfSpeechInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer) {
    Jni::enter(
        [recognizer](JNIEnv* env) { getRecognizer(env, recognizer)->onBeginningOfSpeech(); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onRmsChangedInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jfloat rms) {
    Jni::enter(
        [recognizer, rms](JNIEnv* env) { getRecognizer(env, recognizer)->onRmsChanged(rms); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onBufferReceivedInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jbyteArray sound) {
    Jni::enter([recognizer, sound](JNIEnv* env) {
        const boost::shared_ptr<PlatformRecognizer> target = getRecognizer(env, recognizer);
        Jni::requireNonNull(env, sound, "sound");
        receiveBuffer(env, *target, sound);
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onEndOfSpeechInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer) {
    Jni::enter([recognizer](JNIEnv* env) { getRecognizer(env, recognizer)->onEndOfSpeech(); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onPartialResultsInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jobjectArray texts, jfloatArray scores) {
    Jni::enter([recognizer, texts, scores](JNIEnv* env) {
        const boost::shared_ptr<PlatformRecognizer> target = getRecognizer(env, recognizer);
        target->onPartialResults(readResults(env, texts, scores));
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onResultsInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jobjectArray texts, jfloatArray scores) {
    Jni::enter([recognizer, texts, scores](JNIEnv* env) {
        const boost::shared_ptr<PlatformRecognizer> target = getRecognizer(env, recognizer);
        target->onResults(readResults(env, texts, scores));
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onErrorInternal(JNIEnv* /*env*/,
                                                                                  jclass /*type*/,
                                                                                  jlong recognizer,
                                                                                  jint code) {
    Jni::enter([recognizer, code](JNIEnv* env) { getRecognizer(env, recognizer)->onError(code); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onEventInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong /*recognizer*/, jint /*kind*/, jobject /*parameters*/) {
}

}  // extern "C"
