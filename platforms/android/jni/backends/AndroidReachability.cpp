#include "AndroidReachability.h"

#include <string>

#include "../EntryPoint.h"
#include "core/network/NetworkManager.h"

extern "C" JNIEXPORT void JNICALL
Java_korvel_core_ReachabilityBackend_onReachabilityChangedInternal(JNIEnv* /*env*/, jclass /*type*/,
                                                                   jint value) {
    Jni::enter([value](JNIEnv* /*env*/) {
        Network::NetworkManager::getInstance().overrideReachability(value);
    });
}

void AndroidReachability::install(JNIEnv* env, jobject context) {
    const Jni::LocalRef<jclass> type = Jni::findClass(env, "korvel/core/ReachabilityBackend");
    // It calls back at once, and while the library is loaded its names are not yet searched.
    std::string name("onReachabilityChangedInternal");
    std::string signature("(I)V");
    const JNINativeMethod callback{
        name.data(), signature.data(),
        reinterpret_cast<void*>(
            &Java_korvel_core_ReachabilityBackend_onReachabilityChangedInternal)};
    env->RegisterNatives(type.get(), &callback, 1);
    Jni::check(env);
    const jmethodID start =
        Jni::findStaticMethod(env, type.get(), "start", "(Landroid/content/Context;)V");
    env->CallStaticVoidMethod(type.get(), start, context);
    Jni::check(env);
}
