/**
 * @file
 * Reachability through Java.
 */
#pragma once

#include <jni.h>

/** Listens to `korvel.core.ReachabilityBackend`, whose word then replaces the system's. */
class AndroidReachability {
  public:
    AndroidReachability() = delete;

    /** @param context Android's application context; begins anew when called again
     * @throw Jni::PendingException when Java fails */
    static void install(JNIEnv* env, jobject context);
};
