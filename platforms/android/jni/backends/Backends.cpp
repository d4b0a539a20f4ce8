#include "Backends.h"

#include "../EntryPoint.h"
#include "AndroidLog.h"
#include "AndroidProximitySource.h"
#include "AndroidReachability.h"
#include "AudioRecordRecorder.h"

namespace {

/** @param what names it in the log if it cannot be installed */
template <typename Install>
void tryInstall(JNIEnv* env, const char* what, Install install) {
    try {
        install();
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, what);
    }
}

}  // namespace

void Backends::install(JNIEnv* env) {
    const Jni::LocalRef<jclass> application = Jni::findClass(env, "korvel/core/CoreApplication");
    const Jni::LocalRef<jobject> context = Jni::callStaticObject(
        env, application.get(), "getApplicationContext", "()Landroid/content/Context;");
    if (!context) {
        return;
    }
    tryInstall(env, "LogBackend, Android's log stays off", [env] { AndroidLog::install(env); });
    tryInstall(env, "AudioRecorderBackend, Android's microphone stays off",
               [env] { AudioRecordRecorder::install(env); });
    tryInstall(env, "ProximityBackend, the proximity sensor stays off",
               [env] { AndroidProximitySource::install(env); });
    tryInstall(env, "ReachabilityBackend, the state of the network is not watched",
               [env, &context] { AndroidReachability::install(env, context.get()); });
}

extern "C" {

JNIEXPORT void JNICALL Java_korvel_core_CoreApplication_installBackends(JNIEnv* /*env*/,
                                                                        jclass /*type*/) {
    Jni::enter([](JNIEnv* env) { Backends::install(env); });
}

JNIEXPORT void JNICALL Java_korvel_core_CoreApplication_endInternal(JNIEnv* /*env*/,
                                                                    jclass /*type*/) {
    // Native threads must not call a VM that ends: they would never return, and the process
    // waits for the event lock. Under that lock none of them is inside Java.
    Jni::enter([](JNIEnv* /*env*/) {
        AndroidLog::uninstall();
        kdSetJavaVMKOR(nullptr);
    });
}

}  // extern "C"
