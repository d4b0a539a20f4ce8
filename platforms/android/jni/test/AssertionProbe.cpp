// Entry points of the test class korvel.talvox.impl.AssertionProbe: engine settings that no Java
// call can make, and the count of broken invariants.
#include <boost/make_shared.hpp>

#include "pal/kd_assert.h"
#include "platforms/android/jni/EntryPoint.h"
#include "talvox/Talvox.h"

extern "C" {

JNIEXPORT void JNICALL Java_korvel_talvox_impl_AssertionProbe_addUnknownSetting(JNIEnv* /*env*/,
                                                                                jclass /*type*/) {
    Jni::enter([](JNIEnv* /*env*/) {
        Talvox::Talvox& facade = Talvox::Talvox::getInstance();
        const boost::shared_ptr<Talvox::Settings> settings = facade.getTalvoxSettings()->clone();
        settings->putInt("onemore", 1);
        facade.setTalvoxSettings(settings);
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_AssertionProbe_restoreDefaults(JNIEnv* /*env*/,
                                                                              jclass /*type*/) {
    Jni::enter([](JNIEnv* /*env*/) {
        Talvox::Talvox::getInstance().setTalvoxSettings(boost::make_shared<Talvox::Settings>());
    });
}

JNIEXPORT jlong JNICALL Java_korvel_talvox_impl_AssertionProbe_count(JNIEnv* /*env*/,
                                                                     jclass /*type*/) {
    return kdGetAssertionCountKOR();
}

}  // extern "C"
