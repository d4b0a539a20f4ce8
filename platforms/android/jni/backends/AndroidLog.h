/**
 * @file
 * The log through Java.
 */
#pragma once

#include <jni.h>

/** Sends the platform log to `korvel.core.LogBackend`. */
class AndroidLog {
  public:
    AndroidLog() = delete;

    /** @throw Jni::PendingException when Java fails */
    static void install(JNIEnv* env);

    /** Restores the default log. */
    static void uninstall();
};
