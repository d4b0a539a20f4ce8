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
     * otherwise nothing. One whose Java class is missing or fails is logged and stays off.
     * @throw Jni::PendingException when `CoreApplication` fails
     */
    static void install(JNIEnv* env);
};
