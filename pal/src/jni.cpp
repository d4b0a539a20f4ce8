#include <pthread.h>

#include <atomic>

#include "event_loop.h"
#include "pal/kd_jni.h"

namespace korvel_pal {

namespace {

constexpr jint JNI_VERSION = JNI_VERSION_1_6;

std::atomic<JavaVM*>& javaVm() {
    static std::atomic<JavaVM*> vm{nullptr};
    return vm;
}

/** Fits the type of the environment's address, which differs between the versions of jni.h. */
class AnyPointer {
  public:
    explicit AnyPointer(JNIEnv** env) : pointer(env) {}
    operator JNIEnv**() const { return pointer; }
    operator void**() const { return reinterpret_cast<void**>(pointer); }

  private:
    JNIEnv** pointer;
};

/** Called at the end of a thread that was attached here. */
void detach(void* vm) {
    // A VM that ends holds on to threads that call it, and the event thread is waited for.
    if (vm == javaVm().load() && !EventLoop::instance().isStopping()) {
        static_cast<JavaVM*>(vm)->DetachCurrentThread();
    }
}

pthread_key_t attachmentKey() {
    static const pthread_key_t key = [] {
        pthread_key_t made{};
        pthread_key_create(&made, &detach);
        return made;
    }();
    return key;
}

}  // namespace

}  // namespace korvel_pal

using namespace korvel_pal;

void kdSetJavaVMKOR(JavaVM* vm) {
    attachmentKey();
    javaVm() = vm;
}

JNIEnv* kdGetJNIEnvKOR(void) {
    JavaVM* const vm = javaVm();
    if (vm == nullptr) {
        return nullptr;
    }
    void* known = nullptr;
    if (vm->GetEnv(&known, JNI_VERSION) == JNI_OK) {
        return static_cast<JNIEnv*>(known);
    }
    JNIEnv* env = nullptr;
    if (EventLoop::instance().isStopping() ||
        vm->AttachCurrentThreadAsDaemon(AnyPointer(&env), nullptr) != JNI_OK) {
        return nullptr;
    }
    pthread_setspecific(attachmentKey(), vm);
    return env;
}
