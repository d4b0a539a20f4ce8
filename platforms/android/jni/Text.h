/**
 * @file
 * Java strings and the engine's texts.
 */
#pragma once

#include <jni.h>

#include <string>
#include <vector>

#include "Refs.h"

namespace Jni {

/** Whether the object is a string; null is none. */
bool isText(JNIEnv* env, jobject object);

/** UTF-8 of a string; empty for null. */
std::string toUtf8(JNIEnv* env, jstring text);

/** A new string of UTF-8; what is not UTF-8 becomes U+FFFD. */
LocalRef<jstring> toJString(JNIEnv* env, const std::string& bytes);

/** A new array of strings. */
LocalRef<jobjectArray> toJStrings(JNIEnv* env, const std::vector<std::string>& texts);

}  // namespace Jni
