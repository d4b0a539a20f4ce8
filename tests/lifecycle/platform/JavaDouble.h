/**
 * @file
 * A Java VM of a few functions: all that the platform recognizer calls.
 */
#pragma once

#include <jni.h>

#include "Device.h"

namespace Lifecycle {

/**
 * While it lives, the libraries have a VM. It knows objects of the recogniser's class, which it
 * tells the host about; everything else that is made, called or asked for is accepted and means
 * nothing. Used under the event lock.
 */
class JavaDouble {
  public:
    explicit JavaDouble(DeviceHost& host);
    ~JavaDouble();
    JavaDouble(const JavaDouble&) = delete;
    JavaDouble& operator=(const JavaDouble&) = delete;

    /** Local and global references that were not deleted. */
    long countReferences() const;

  private:
    JNINativeInterface_ functions{};
    JNIEnv env{};
    JNIInvokeInterface_ invocations{};
    JavaVM vm{};
};

}  // namespace Lifecycle
