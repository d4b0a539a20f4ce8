// Entry points of korvel.talvox.impl.Recognizer.
#include <boost/make_shared.hpp>
#include <new>

#include "Engine.h"
#include "EntryPoint.h"
#include "RecognizerListenerImpl.h"

namespace {

using Handles = Jni::OwnedHandles<RecognizerListenerImpl>;

Jni::LocalRef<jobject> readSettings(JNIEnv* env, jobject javaObject) {
    const Jni::LocalRef<jclass> type(env, env->GetObjectClass(javaObject));
    const jfieldID field = env->GetFieldID(type.get(), "settings", "Landroid/os/Bundle;");
    Jni::check(env);
    Jni::LocalRef<jobject> settings(env, env->GetObjectField(javaObject, field));
    Jni::requireNonNull(env, settings.get(), "settings");
    return settings;
}

jlong start(JNIEnv* env, jlong engine, jobject javaObject) {
    const Talvox::Talvox& facade = Jni::getEngine(env, engine);
    Jni::requireNonNull(env, javaObject, "recognizer");
    const Jni::LocalRef<jobject> bundle = readSettings(env, javaObject);
    const boost::shared_ptr<const Talvox::Settings> settings = Jni::makeSettings(
        facade, bundle.get(), "settings->conformsTo(Talvox::Settings::bundleSpecs)");
    const auto listener = boost::make_shared<RecognizerListenerImpl>();
    const boost::shared_ptr<Talvox::Recognizer> recognizer =
        facade.createRecognizer(listener, settings);
    if (!recognizer) {
        throw std::bad_alloc();
    }
    listener->setRecognizer(recognizer);
    listener->attach(env, javaObject);
    // Nothing may fail any more once events have come.
    const jlong handle = Handles::add(listener);
    recognizer->start();
    return handle;
}

}  // namespace

extern "C" {

JNIEXPORT jlong JNICALL Java_korvel_talvox_impl_Recognizer_start(JNIEnv* /*env*/, jclass /*type*/,
                                                                 jlong engine, jobject object) {
    return Jni::enter<jlong>(0,
                             [engine, object](JNIEnv* env) { return start(env, engine, object); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_Recognizer_stop(JNIEnv* /*env*/, jclass /*type*/,
                                                               jlong recognizer) {
    Jni::enter([recognizer](JNIEnv* env) {
        // A copy: a listener may release the handle from inside an event.
        const boost::shared_ptr<Talvox::Recognizer> target =
            Handles::get(env, recognizer)->getRecognizer();
        target->stop();
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_Recognizer_cancel(JNIEnv* /*env*/, jclass /*type*/,
                                                                 jlong recognizer) {
    Jni::enter([recognizer](JNIEnv* env) {
        const boost::shared_ptr<Talvox::Recognizer> target =
            Handles::get(env, recognizer)->getRecognizer();
        target->cancel();
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_Recognizer_releaseRecognizer(JNIEnv* /*env*/,
                                                                            jclass /*type*/,
                                                                            jlong recognizer) {
    Jni::enter([recognizer](JNIEnv* env) { Handles::release(env, recognizer)->detach(); });
}

}  // extern "C"
