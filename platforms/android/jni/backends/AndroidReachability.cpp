#include "AndroidReachability.h"

#include "../EntryPoint.h"
#include "core/network/NetworkManager.h"

void AndroidReachability::install(JNIEnv* env, jobject context) {
    const Jni::LocalRef<jclass> type = Jni::findClass(env, "korvel/core/ReachabilityBackend");
    const jmethodID start =
        Jni::findStaticMethod(env, type.get(), "start", "(Landroid/content/Context;)V");
    env->CallStaticVoidMethod(type.get(), start, context);
    Jni::check(env);
}

extern "C" JNIEXPORT void JNICALL
Java_korvel_core_ReachabilityBackend_onReachabilityChangedInternal(JNIEnv* /*env*/, jclass /*type*/,
                                                                   jint value) {
    Jni::enter([value](JNIEnv* /*env*/) {
        Network::NetworkManager::getInstance().overrideReachability(value);
    });
}
