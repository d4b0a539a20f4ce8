/**
 * @file
 * The Java VM of the process. Installed only by builds with the Java bindings; not part of kd.h,
 * because it needs jni.h: compile with the include directories of a JDK, or for Android.
 */
#ifndef KORVEL_PAL_KD_JNI_H
#define KORVEL_PAL_KD_JNI_H

#include <jni.h>

#include "pal/kd_types.h"

KD_EXTERN_C_BEGIN

/**
 * Names the process's Java VM, once, from `JNI_OnLoad`. The VM must live as long as the library is
 * used; null takes it back.
 */
KD_API void kdSetJavaVMKOR(JavaVM* vm);

/**
 * The calling thread's environment, valid on this thread only. A thread that the VM does not know
 * is attached as a daemon, and detached when it ends.
 * @return null where there is no VM, or where the VM takes no more threads because it ends
 */
KD_API JNIEnv* kdGetJNIEnvKOR(void);

KD_EXTERN_C_END

#endif
