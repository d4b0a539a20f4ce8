/**
 * @file
 * What Android lends to the core library.
 */
#pragma once

#include <jni.h>

/** Installs the back ends that are written in Java. */
class Backends {
  public:
    Backends() = delete;

    /**
     * Installs all of them when the process has an Android application, real or simulated;
     * otherwise nothing.
     * @throw Jni::PendingException when Java fails
     */
    static void install(JNIEnv* env);
};
