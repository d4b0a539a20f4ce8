#include "ProximityGestureRecognizerListener.h"

#include <boost/make_shared.hpp>

#include "Env.h"
#include "Text.h"
#include "pal/kd_jni.h"

namespace {

const char* const METHOD = "onProximityGestureRecognized";
const jint FRAME_SIZE = 10;

}  // namespace

ProximityGestureRecognizerListener::ProximityGestureRecognizerListener(JNIEnv* env, jobject object)
    : javaObject(env, object),
      recognizer(boost::make_shared<Sensor::ProximityGestureRecognizer>()) {
    const Jni::LocalRef<jclass> type(env, env->GetObjectClass(object));
    javaClass = Jni::GlobalRef(env, type.get());
    recognizer->setCallback([this](const std::string& gesture) { onGestureRecognized(gesture); });
}

ProximityGestureRecognizerListener::~ProximityGestureRecognizerListener() {
    detach();
}

void ProximityGestureRecognizerListener::detach() {
    recognizer->setCallback(nullptr);
    recognizer->stop();
    javaObject.reset();
    javaClass.reset();
}

void ProximityGestureRecognizerListener::onGestureRecognized(const std::string& gesture) {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr || !javaObject) {
        return;
    }
    try {
        const Jni::LocalFrame frame(env, FRAME_SIZE);
        const jmethodID method =
            Jni::findMethod(env, javaClass.getClass(), METHOD, "(Ljava/lang/String;)V");
        const Jni::LocalRef<jstring> text = Jni::toJString(env, gesture);
        env->CallNonvirtualVoidMethod(javaObject.get(), javaClass.getClass(), method, text.get());
        Jni::check(env);
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, METHOD);
    }
}
