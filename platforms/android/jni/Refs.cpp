#include "Refs.h"

#include <new>

#include "Env.h"
#include "pal/kd_jni.h"

namespace Jni {

GlobalRef::GlobalRef(JNIEnv* env, jobject object)
    : ref(object != nullptr ? env->NewGlobalRef(object) : nullptr) {
    if (object != nullptr && ref == nullptr) {
        throw std::bad_alloc();
    }
}

GlobalRef& GlobalRef::operator=(GlobalRef&& other) noexcept {
    if (this != &other) {
        reset();
        ref = std::exchange(other.ref, nullptr);
    }
    return *this;
}

GlobalRef::~GlobalRef() {
    reset();
}

void GlobalRef::reset() {
    if (ref == nullptr) {
        return;
    }
    if (JNIEnv* const env = kdGetJNIEnvKOR()) {
        env->DeleteGlobalRef(ref);
    }
    ref = nullptr;
}

LocalFrame::LocalFrame(JNIEnv* environment, jint capacity, jint enough)
    : env(environment), pushed(push(capacity) || push(enough)) {}

bool LocalFrame::push(jint capacity) {
    if (env->PushLocalFrame(capacity) == JNI_OK) {
        return true;
    }
    env->ExceptionClear();
    return false;
}

LocalFrame::~LocalFrame() {
    if (pushed) {
        env->PopLocalFrame(nullptr);
    }
}

}  // namespace Jni
