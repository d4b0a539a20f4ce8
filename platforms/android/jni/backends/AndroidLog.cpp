#include "AndroidLog.h"

#include <cstdio>

#include "../Env.h"
#include "../Text.h"
#include "pal/kd_jni.h"
#include "pal/kd_log.h"

namespace {

/** What the sink calls; kept, because looking it up could log. */
struct Target {
    Jni::GlobalRef type;
    jmethodID write = nullptr;
};

Target& target() {
    static auto* const instance = new Target;
    return *instance;
}

/** Sets a pending exception aside: it must not stop the log, nor the log lose it. */
class ExceptionAside {
  public:
    explicit ExceptionAside(JNIEnv* environment)
        : env(environment), exception(environment, environment->ExceptionOccurred()) {
        env->ExceptionClear();
    }
    ~ExceptionAside() {
        env->ExceptionClear();
        if (exception) {
            env->Throw(exception.get());
        }
    }
    ExceptionAside(const ExceptionAside&) = delete;
    ExceptionAside& operator=(const ExceptionAside&) = delete;

  private:
    JNIEnv* env;
    const Jni::LocalRef<jthrowable> exception;
};

void writeToJava(const char* message, void* /*user*/) {
    if (JNIEnv* const env = kdGetJNIEnvKOR()) {
        const ExceptionAside aside(env);
        try {
            const Jni::LocalRef<jstring> text = Jni::toJString(env, message);
            env->CallStaticVoidMethod(target().type.getClass(), target().write, text.get());
            Jni::check(env);
            return;
        } catch (...) {
            // Not lost; see below.
            env->ExceptionClear();
        }
    }
    std::fprintf(stderr, "%s\n", message);
}

}  // namespace

void AndroidLog::install(JNIEnv* env) {
    const Jni::LocalRef<jclass> type = Jni::findClass(env, "korvel/core/LogBackend");
    const jmethodID write =
        Jni::findStaticMethod(env, type.get(), "write", "(Ljava/lang/String;)V");
    uninstall();
    target().type = Jni::GlobalRef(env, type.get());
    target().write = write;
    kdSetLogSinkKOR(&writeToJava, nullptr);
}

void AndroidLog::uninstall() {
    kdSetLogSinkKOR(nullptr, nullptr);
}
