#include "Backends.h"

#include "../EntryPoint.h"
#include "AndroidLog.h"
#include "AndroidProximitySource.h"
#include "AndroidReachability.h"
#include "AudioRecordRecorder.h"

void Backends::install(JNIEnv* env) {
    const Jni::LocalRef<jclass> application = Jni::findClass(env, "korvel/core/CoreApplication");
    const Jni::LocalRef<jobject> context = Jni::callStaticObject(
        env, application.get(), "getApplicationContext", "()Landroid/content/Context;");
    if (!context) {
        return;
    }
    AndroidLog::install(env);
    AudioRecordRecorder::install();
    AndroidProximitySource::install();
    AndroidReachability::install(env, context.get());
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
