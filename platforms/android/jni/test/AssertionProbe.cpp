// Entry points of the test class korvel.talvox.impl.AssertionProbe: the count of broken invariants.
#include <jni.h>

#include "pal/kd_assert.h"

extern "C" {

JNIEXPORT jlong JNICALL Java_korvel_talvox_impl_AssertionProbe_count(JNIEnv* /*env*/,
                                                                     jclass /*type*/) {
    return kdGetAssertionCountKOR();
}

}  // extern "C"
