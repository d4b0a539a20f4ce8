// Entry points of korvel.talvox.proximity.ProximityGestureRecognizer.
#include <boost/make_shared.hpp>

#include "EntryPoint.h"
#include "Handles.h"
#include "ProximityGestureRecognizerListener.h"
#include "Text.h"

namespace {

using Listener = ProximityGestureRecognizerListener;
using Handles = Jni::OwnedHandles<Listener>;

jlong create(JNIEnv* env, jobject object) {
    Jni::requireNonNull(env, object, "listener");
    const auto listener = boost::make_shared<Listener>(env, object);
    return Handles::add(listener);
}

}  // namespace

extern "C" {

JNIEXPORT jlong JNICALL Java_korvel_talvox_proximity_ProximityGestureRecognizer_create(
    JNIEnv* /*env*/, jclass /*type*/, jobject listener) {
    return Jni::enter<jlong>(0, [listener](JNIEnv* env) { return create(env, listener); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_proximity_ProximityGestureRecognizer_start(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer) {
    Jni::enter([recognizer](JNIEnv* env) {
        const boost::shared_ptr<Listener> listener = Handles::get(env, recognizer);
        listener->getRecognizer().start();
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_proximity_ProximityGestureRecognizer_stop(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer) {
    Jni::enter([recognizer](JNIEnv* env) {
        const boost::shared_ptr<Listener> listener = Handles::get(env, recognizer);
        listener->getRecognizer().stop();
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_proximity_ProximityGestureRecognizer_addGesture(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer, jstring name, jstring pattern) {
    Jni::enter([recognizer, name, pattern](JNIEnv* env) {
        const boost::shared_ptr<Listener> listener = Handles::get(env, recognizer);
        Jni::requireNonNull(env, name, "name");
        Jni::requireNonNull(env, pattern, "pattern");
        const std::string error =
            listener->getRecognizer().addGesture(Jni::toUtf8(env, name), Jni::toUtf8(env, pattern));
        if (!error.empty()) {
            Jni::raise(env, "java/lang/IllegalArgumentException", error);
        }
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_proximity_ProximityGestureRecognizer_releaseRecognizer(
    JNIEnv* /*env*/, jclass /*type*/, jlong recognizer) {
    Jni::enter([recognizer](JNIEnv* env) { Handles::release(env, recognizer)->detach(); });
}

}  // extern "C"
