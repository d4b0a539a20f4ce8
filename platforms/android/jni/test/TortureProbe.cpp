// Entry points of the test class korvel.talvox.impl.TortureProbe: the library that lets calls fail,
// where it is preloaded, and the platform clock.
#include <dlfcn.h>
#include <jni.h>

#include "pal/kd_event.h"
#include "pal/kd_time.h"

namespace {

template <typename Function>
Function* find(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_DEFAULT, name));
}

/** Whose calls fail: the engine's and those of the libraries below it, none of the VM. */
const char* const LIBRARIES[] = {"/libKorvel",  "/libcurl.",   "/libssl.",
                                 "/libcrypto.", "/libspeex.",  "/libogg.",
                                 "/libpulse",   "/libtinyxml", "/libstdc++.so"};

const char* failedName = nullptr;

}  // namespace

extern "C" {

JNIEXPORT jboolean JNICALL Java_korvel_talvox_impl_TortureProbe_prepare(JNIEnv* /*env*/,
                                                                        jclass /*type*/) {
    auto* const restrictTo = find<void(const char*)>("tortureRestrictTo");
    if (restrictTo == nullptr) {
        return JNI_FALSE;
    }
    for (const char* const library : LIBRARIES) {
        restrictTo(library);
    }
    kdUseManualClockKOR(1000000000);
    return JNI_TRUE;
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_TortureProbe_arm(JNIEnv* /*env*/, jclass /*type*/,
                                                                jint kind, jlong call,
                                                                jboolean onward) {
    failedName = nullptr;
    find<void(int, long, int, int, const char**)>("tortureArm")(kind, static_cast<long>(call),
                                                                onward, 0, &failedName);
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_TortureProbe_disarm(JNIEnv* /*env*/,
                                                                   jclass /*type*/) {
    find<void()>("tortureDisarm")();
}

JNIEXPORT jboolean JNICALL Java_korvel_talvox_impl_TortureProbe_hasFailed(JNIEnv* /*env*/,
                                                                          jclass /*type*/) {
    return failedName != nullptr ? JNI_TRUE : JNI_FALSE;
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_TortureProbe_advanceMs(JNIEnv* /*env*/,
                                                                      jclass /*type*/,
                                                                      jlong milliseconds) {
    kdAdvanceClockKOR(milliseconds * 1000000);
    kdDrainEventsKOR();
}

}  // extern "C"
