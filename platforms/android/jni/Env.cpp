#include "Env.h"

#include <algorithm>
#include <cstring>
#include <stdexcept>

#include "Text.h"
#include "pal/kd_jni.h"
#include "pal/kd_log.h"

namespace Jni {

namespace {

/** The application's loader; lives as long as the library. */
GlobalRef& classLoader() {
    static auto* const loader = new GlobalRef;
    return *loader;
}

std::string describe(JNIEnv* env, jthrowable exception) {
    const LocalRef<jclass> writerClass(env, env->FindClass("java/io/StringWriter"));
    check(env);
    const LocalRef<jobject> writer = newObject(env, writerClass.get(), "()V");
    const LocalRef<jclass> printerClass(env, env->FindClass("java/io/PrintWriter"));
    check(env);
    const LocalRef<jobject> printer =
        newObject(env, printerClass.get(), "(Ljava/io/Writer;)V", writer.get());
    callVoid(env, exception, "printStackTrace", "(Ljava/io/PrintWriter;)V", printer.get());
    callVoid(env, printer.get(), "flush", "()V");
    const LocalRef<jstring> text =
        callObject(env, writer.get(), "toString", "()Ljava/lang/String;").as<jstring>();
    return toUtf8(env, text.get());
}

/** Takes no memory of ours. Does nothing where what failed has left an exception. */
void throwOutOfMemory(JNIEnv* env) noexcept {
    if (env->ExceptionCheck() != JNI_FALSE) {
        return;
    }
    const LocalRef<jclass> type(env, env->FindClass("java/lang/OutOfMemoryError"));
    if (type) {
        env->ThrowNew(type.get(), "native code has no memory");
    }
}

}  // namespace

JNIEnv* getEnv() {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr) {
        throw std::runtime_error("no Java VM");
    }
    return env;
}

void check(JNIEnv* env) {
    if (env->ExceptionCheck() != JNI_FALSE) {
        throw PendingException();
    }
}

void throwNew(JNIEnv* env, const char* className, const char* message) noexcept {
    if (env->ExceptionCheck() != JNI_FALSE) {
        return;
    }
    try {
        const LocalRef<jclass> type(env, env->FindClass(className));
        check(env);
        const LocalRef<jstring> text = toJString(env, message);
        const LocalRef<jobject> exception =
            newObject(env, type.get(), "(Ljava/lang/String;)V", text.get());
        env->Throw(static_cast<jthrowable>(exception.get()));
    } catch (...) {
        throwOutOfMemory(env);
    }
}

void raise(JNIEnv* env, const char* className, const std::string& message) {
    throwNew(env, className, message.c_str());
    throw PendingException();
}

void requireNonNull(JNIEnv* env, jobject argument, const char* name) {
    if (argument == nullptr) {
        raise(env, "java/lang/NullPointerException", std::string(name) + " is null");
    }
}

void logAndClear(JNIEnv* env, const char* where) noexcept {
    const LocalRef<jthrowable> exception(env, env->ExceptionOccurred());
    if (!exception) {
        return;
    }
    env->ExceptionClear();
    try {
        kdLogFormatMessage("Java exception in %s: %s", where,
                           describe(env, exception.get()).c_str());
    } catch (...) {
        env->ExceptionClear();
        kdLogFormatMessage("Java exception in %s that does not describe itself", where);
    }
}

void keepClassLoader(JNIEnv* env, jclass classOfApplication) {
    const LocalRef<jobject> loader =
        callObject(env, classOfApplication, "getClassLoader", "()Ljava/lang/ClassLoader;");
    classLoader() = GlobalRef(env, loader.get());
}

LocalRef<jclass> findClass(JNIEnv* env, const char* name) {
    // Every loader knows the system's own, and asking the VM is quicker.
    const bool isSystem = std::strncmp(name, "java/", std::strlen("java/")) == 0;
    if (isSystem || !classLoader()) {
        LocalRef<jclass> found(env, env->FindClass(name));
        check(env);
        return found;
    }
    std::string dotted(name);
    std::replace(dotted.begin(), dotted.end(), '/', '.');
    const LocalRef<jstring> text = toJString(env, dotted);
    const LocalRef<jclass> loaderClass(env, env->FindClass("java/lang/ClassLoader"));
    check(env);
    const jmethodID loadClass =
        findMethod(env, loaderClass.get(), "loadClass", "(Ljava/lang/String;)Ljava/lang/Class;");
    LocalRef<jclass> found(env, static_cast<jclass>(env->CallObjectMethod(classLoader().get(),
                                                                          loadClass, text.get())));
    check(env);
    return found;
}

jmethodID findMethod(JNIEnv* env, jclass owner, const char* name, const char* signature) {
    const jmethodID method = env->GetMethodID(owner, name, signature);
    check(env);
    return method;
}

jmethodID findStaticMethod(JNIEnv* env, jclass owner, const char* name, const char* signature) {
    const jmethodID method = env->GetStaticMethodID(owner, name, signature);
    check(env);
    return method;
}

}  // namespace Jni
