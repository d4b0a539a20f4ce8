/**
 * @file
 * What the bindings of the engine and of the recognizers share.
 */
#pragma once

#include <jni.h>

#include <boost/shared_ptr.hpp>

#include "Handles.h"
#include "talvox/Settings.h"
#include "talvox/Talvox.h"

namespace Jni {

/**
 * The facade behind Java's engine handle.
 * @throw PendingException with an `IllegalStateException` for any other number
 */
Talvox::Talvox& getEngine(JNIEnv* env, jlong handle);

/**
 * A copy of the engine's settings with an Android bundle's entries in place of its own.
 * @param condition what is reported when the copy is no complete settings object
 * @throw PendingException when Java fails
 */
boost::shared_ptr<Talvox::Settings> makeSettings(const Talvox::Talvox& facade, jobject bundle,
                                                 const char* condition);

}  // namespace Jni
