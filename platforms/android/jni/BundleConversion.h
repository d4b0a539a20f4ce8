/**
 * @file
 * Between Android's bundles and the engine's.
 */
#pragma once

#include <jni.h>

#include <boost/shared_ptr.hpp>

#include "util/Bundle.h"

/**
 * A new Android bundle (a local reference that the caller owns) with all elements. A position
 * becomes an `android.location.Location` of the provider "Talvox".
 * @throw Jni::PendingException when Java fails
 */
jobject bundleToJBundle(const Util::Bundle& bundle);

/**
 * A clone of `base` with what the Android bundle says in place of it; see `updateFromJBundle`.
 * @throw Jni::PendingException when Java fails
 */
boost::shared_ptr<Util::Bundle> jBundleToBundle(jobject javaBundle, const Util::Bundle& base,
                                                const Util::Bundle::ElemSpec* spec);

/**
 * Writes the entries of an Android bundle into `target`, as far as the table knows their keys in
 * any spelling. An entry whose key is unknown, whose value is null or whose value is not of the
 * table's type (no conversion is made) is logged and changes nothing.
 * @throw Jni::PendingException when Java fails
 */
void updateFromJBundle(jobject javaBundle, Util::Bundle& target,
                       const Util::Bundle::ElemSpec* spec);
