#include "Engine.h"

#include "BundleConversion.h"
#include "pal/kd_assert.h"

namespace Jni {

namespace {

const char* const ASSERT_PATH = "platforms/android/jni/RecognizerService";

}  // namespace

Talvox::Talvox& getEngine(JNIEnv* env, jlong handle) {
    Talvox::Talvox& facade = Talvox::Talvox::getInstance();
    if (handle != toHandle(&facade)) {
        raise(env, "java/lang/IllegalStateException",
              handle == 0 ? "the engine has no handle (null)" : "not the engine's handle");
    }
    return facade;
}

boost::shared_ptr<Talvox::Settings> makeSettings(const Talvox::Talvox& facade, jobject bundle,
                                                 const char* condition) {
    using Talvox::Settings;
    boost::shared_ptr<Settings> settings = facade.getTalvoxSettings()->clone();
    updateFromJBundle(bundle, *settings, Settings::bundleSpecs);
    KOR_ASSERT_AT(settings->conformsTo(Settings::bundleSpecs), condition, ASSERT_PATH, __LINE__);
    return settings;
}

}  // namespace Jni
