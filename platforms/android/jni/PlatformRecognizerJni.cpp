// Entry points of korvel.talvox.impl.PlatformRecognizer.
#include <boost/make_shared.hpp>
#include <optional>
#include <string>
#include <vector>

#include "EntryPoint.h"
#include "Handles.h"
#include "PlatformRecognizer.h"
#include "Text.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"

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

/** Null, once that is reported, for what cannot be results: no texts, or scores of another length.
 */
boost::shared_ptr<const RecognitionResults> readResults(JNIEnv* env, jobjectArray strings,
                                                        jfloatArray jconfidenceScores) {
    if (strings == nullptr) {
        kdLogFormatMessage("PlatformRecognizer: results without an array of texts");
        return {};
    }
    const std::vector<jfloat> scores = readScores(env, jconfidenceScores);
    const jsize count = env->GetArrayLength(strings);
    if (!KOR_ASSERT_AT(
            jconfidenceScores == nullptr || static_cast<std::size_t>(count) == scores.size(),
            SAME_LENGTH, ASSERT_PATH, __LINE__)) {
        return {};
    }
    auto results = boost::make_shared<RecognitionResults>();
    int ignored = 0;
    for (jsize index = 0; index < count; ++index) {
        const Jni::LocalRef<jstring> text(
            env, static_cast<jstring>(env->GetObjectArrayElement(strings, index)));
        Jni::check(env);
        if (!text) {
            ++ignored;
            continue;
        }
        results->emplace_back(Jni::toUtf8(env, text.get()),
                              jconfidenceScores != nullptr ? scores[static_cast<std::size_t>(index)]
                                                           : RecognitionResult::UNKNOWN_CONFIDENCE);
    }
    if (ignored > 0) {
        kdLogFormatMessage("PlatformRecognizer: %d of %d hypotheses are null, ignored", ignored,
                           static_cast<int>(count));
    }
    return results;
}

/** Hands a callback to its recognizer, whose session ends where something throws. */
template <typename Callback>
void receive(jlong handle, Callback callback) noexcept {
    Jni::enter([handle, &callback](JNIEnv* env) {
        const boost::shared_ptr<PlatformRecognizer> target = getRecognizer(env, handle);
        target->enter([&] { callback(env, *target); });
    });
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
    receive(recognizer,
            [](JNIEnv* /*env*/, PlatformRecognizer& target) { target.onReadyForSpeech(); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onBeginningOfSpeechInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer) {
    receive(recognizer,
            [](JNIEnv* /*env*/, PlatformRecognizer& target) { target.onBeginningOfSpeech(); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onRmsChangedInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jfloat rms) {
    receive(recognizer,
            [rms](JNIEnv* /*env*/, PlatformRecognizer& target) { target.onRmsChanged(rms); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onBufferReceivedInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jbyteArray sound) {
    receive(recognizer, [sound](JNIEnv* env, PlatformRecognizer& target) {
        if (sound != nullptr) {
            receiveBuffer(env, target, sound);
        }
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onEndOfSpeechInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer) {
    receive(recognizer,
            [](JNIEnv* /*env*/, PlatformRecognizer& target) { target.onEndOfSpeech(); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onPartialResultsInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jobjectArray texts, jfloatArray scores) {
    receive(recognizer, [texts, scores](JNIEnv* env, PlatformRecognizer& target) {
        if (const auto results = readResults(env, texts, scores)) {
            target.onPartialResults(results);
        }
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onResultsInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jobjectArray texts, jfloatArray scores) {
    receive(recognizer, [texts, scores](JNIEnv* env, PlatformRecognizer& target) {
        if (const auto results = readResults(env, texts, scores)) {
            target.onResults(results);
        } else {
            target.onError(Talvox::SpeechError::ErrorUnknown);
        }
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onErrorInternal(JNIEnv* /*env*/,
                                                                                  jclass /*type*/,
                                                                                  jlong recognizer,
                                                                                  jint code) {
    receive(recognizer,
            [code](JNIEnv* /*env*/, PlatformRecognizer& target) { target.onError(code); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onErrorCauseInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jobject number, jstring reason) {
    receive(recognizer, [number, reason](JNIEnv* env, PlatformRecognizer& target) {
        target.onErrorCause(number == nullptr ? std::nullopt
                                              : std::make_optional<int>(
                                                    Jni::callInt(env, number, "intValue", "()I")),
                            reason == nullptr ? std::string() : Jni::toUtf8(env, reason));
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_PlatformRecognizer_onEventInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jint /*kind*/, jobject /*parameters*/) {
    Jni::enter([recognizer](JNIEnv* /*env*/) {
        if (const auto target = Jni::KnownObjects<PlatformRecognizer>::find(recognizer)) {
            target->onEvent();
        }
    });
}

}  // extern "C"
