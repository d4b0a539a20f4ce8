/**
 * @file
 * What every entry point from Java does.
 */
#pragma once

#include <jni.h>

#include <exception>

#include "Env.h"
#include "core/util/EventLock.h"
#include "pal/kd_jni.h"

namespace Jni {

/**
 * Runs the body of an entry point for threads that must not wait, without the event lock. A Java
 * exception that is pending at its end goes back to Java, a C++ exception as a
 * `RuntimeException`. Does nothing once the VM ends.
 * @param body called with the calling thread's environment
 */
template <typename Body>
void enterUnlocked(Body body) noexcept {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr) {
        return;
    }
    try {
        body(env);
    } catch (const PendingException&) {
        return;
    } catch (const std::exception& failure) {
        throwNew(env, "java/lang/RuntimeException", failure.what());
    } catch (...) {
        throwNew(env, "java/lang/RuntimeException", "unknown native failure");
    }
}

/** The same under the event lock. */
template <typename Body>
void enter(Body body) noexcept {
    enterUnlocked([&body](JNIEnv*) {
        const Util::EventLock lock;
        // Asked again: the VM is taken away under the lock, perhaps while this thread waited for
        // it.
        if (JNIEnv* const env = kdGetJNIEnvKOR()) {
            body(env);
        }
    });
}

/** The same with a value, which is `fallback` when there is an exception. */
template <typename Result, typename Body>
Result enter(Result fallback, Body body) noexcept {
    Result result = fallback;
    enter([&result, &body](JNIEnv* env) { result = body(env); });
    return result;
}

}  // namespace Jni
