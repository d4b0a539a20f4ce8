/**
 * @file
 * Looking up and calling Java, with every failure as a C++ exception.
 */
#pragma once

#include <jni.h>

#include <exception>
#include <string>

#include "Refs.h"

namespace Jni {

/** Thrown while a Java exception is pending on the thread; carries nothing itself. */
class PendingException : public std::exception {
  public:
    const char* what() const noexcept override { return "a Java exception"; }
};

/** The calling thread's environment. @throw std::runtime_error where there is no VM (any more) */
JNIEnv* getEnv();

/** Throws `PendingException` when a Java exception is pending. */
void check(JNIEnv* env);

/** Makes a Java exception pending, unless there is one already. */
void throwNew(JNIEnv* env, const char* className, const char* message) noexcept;

/** Makes a Java exception pending and throws `PendingException`. */
[[noreturn]] void raise(JNIEnv* env, const char* className, const std::string& message);

/** Raises a `NullPointerException` that names the argument when it is null. */
void requireNonNull(JNIEnv* env, jobject argument, const char* name);

/**
 * Clears a pending exception and logs it with its stack. Does nothing without one.
 * @param where what was called, for the log
 */
void logAndClear(JNIEnv* env, const char* where) noexcept;

/** Keeps the class loader of a class of the application for `findClass`. From `JNI_OnLoad`. */
void keepClassLoader(JNIEnv* env, jclass classOfApplication);

/**
 * Finds a class through the loader that was kept, also from threads that Java did not start.
 * @param name with slashes, such as "android/os/Bundle"
 */
LocalRef<jclass> findClass(JNIEnv* env, const char* name);

jmethodID findMethod(JNIEnv* env, jclass owner, const char* name, const char* signature);
jmethodID findStaticMethod(JNIEnv* env, jclass owner, const char* name, const char* signature);

/** An object of the class, made by its constructor with the signature. */
template <typename... Args>
LocalRef<jobject> newObject(JNIEnv* env, jclass type, const char* signature, Args... args) {
    const jmethodID constructor = findMethod(env, type, "<init>", signature);
    LocalRef<jobject> object(env, env->NewObject(type, constructor, args...));
    check(env);
    return object;
}

template <typename... Args>
void callVoid(JNIEnv* env, jobject object, const char* name, const char* signature, Args... args) {
    const LocalRef<jclass> type(env, env->GetObjectClass(object));
    const jmethodID method = findMethod(env, type.get(), name, signature);
    env->CallVoidMethod(object, method, args...);
    check(env);
}

template <typename... Args>
LocalRef<jobject> callObject(JNIEnv* env, jobject object, const char* name, const char* signature,
                             Args... args) {
    const LocalRef<jclass> type(env, env->GetObjectClass(object));
    const jmethodID method = findMethod(env, type.get(), name, signature);
    LocalRef<jobject> result(env, env->CallObjectMethod(object, method, args...));
    check(env);
    return result;
}

/** Calls a method of a primitive type by the environment's function for that type. */
template <typename T, typename... Args>
T callPrimitive(JNIEnv* env, T (JNIEnv::*function)(jobject, jmethodID, ...), jobject object,
                const char* name, const char* signature, Args... args) {
    const LocalRef<jclass> type(env, env->GetObjectClass(object));
    const jmethodID method = findMethod(env, type.get(), name, signature);
    const T result = (env->*function)(object, method, args...);
    check(env);
    return result;
}

template <typename... Args>
jboolean callBoolean(JNIEnv* env, jobject object, const char* name, const char* signature,
                     Args... args) {
    return callPrimitive(env, &JNIEnv::CallBooleanMethod, object, name, signature, args...);
}

template <typename... Args>
jint callInt(JNIEnv* env, jobject object, const char* name, const char* signature, Args... args) {
    return callPrimitive(env, &JNIEnv::CallIntMethod, object, name, signature, args...);
}

template <typename... Args>
jfloat callFloat(JNIEnv* env, jobject object, const char* name, const char* signature,
                 Args... args) {
    return callPrimitive(env, &JNIEnv::CallFloatMethod, object, name, signature, args...);
}

template <typename... Args>
jdouble callDouble(JNIEnv* env, jobject object, const char* name, const char* signature,
                   Args... args) {
    return callPrimitive(env, &JNIEnv::CallDoubleMethod, object, name, signature, args...);
}

template <typename... Args>
LocalRef<jobject> callStaticObject(JNIEnv* env, jclass owner, const char* name,
                                   const char* signature, Args... args) {
    const jmethodID method = findStaticMethod(env, owner, name, signature);
    LocalRef<jobject> result(env, env->CallStaticObjectMethod(owner, method, args...));
    check(env);
    return result;
}

}  // namespace Jni
