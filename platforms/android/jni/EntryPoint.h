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
 * Runs the body of an entry point under the event lock. A Java exception that is pending at its
 * end goes back to Java, a C++ exception as a `RuntimeException`; the value is `fallback` then.
 * @param body called with the calling thread's environment
 */
template <typename Result, typename Body>
Result enter(Result fallback, Body body) noexcept {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr) {
        return fallback;
    }
    try {
        const Util::EventLock lock;
        return body(env);
    } catch (const PendingException&) {
        return fallback;
    } catch (const std::exception& failure) {
        throwNew(env, "java/lang/RuntimeException", failure.what());
    } catch (...) {
        throwNew(env, "java/lang/RuntimeException", "unknown native failure");
    }
    return fallback;
}

/** The same without a value. */
template <typename Body>
void enter(Body body) noexcept {
    enter<bool>(false, [&body](JNIEnv* env) {
        body(env);
        return true;
    });
}

}  // namespace Jni
