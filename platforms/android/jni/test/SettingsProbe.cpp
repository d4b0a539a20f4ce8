// Entry points of the test class korvel.talvox.impl.SettingsProbe: engine settings that no Java
// call can make, and the table of levels.
#include <boost/make_shared.hpp>
#include <string>
#include <vector>

#include "platforms/android/jni/EntryPoint.h"
#include "platforms/android/jni/Text.h"
#include "talvox/Talvox.h"

namespace {

using Talvox::Settings;

bool isOfEngine(Settings::Level level) {
    return level == Settings::Level::ENGINE || level == Settings::Level::ENGINE_FOR_CLOUD;
}

jobjectArray findKeys(bool areOfEngine) {
    return Jni::enter<jobjectArray>(nullptr, [areOfEngine](JNIEnv* env) {
        std::vector<std::string> keys;
        for (const Settings::KeyLevel* row = Settings::keyLevels; row->key != nullptr; ++row) {
            if (isOfEngine(row->level) == areOfEngine) {
                keys.emplace_back(row->key);
            }
        }
        return Jni::toJStrings(env, keys).release();
    });
}

}  // namespace

extern "C" {

JNIEXPORT void JNICALL Java_korvel_talvox_impl_SettingsProbe_addUnknownSetting(JNIEnv* /*env*/,
                                                                               jclass /*type*/) {
    Jni::enter([](JNIEnv* /*env*/) {
        Talvox::Talvox& facade = Talvox::Talvox::getInstance();
        const boost::shared_ptr<Settings> settings = facade.getTalvoxSettings()->clone();
        settings->putInt("onemore", 1);
        facade.setTalvoxSettings(settings);
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_SettingsProbe_restoreDefaults(JNIEnv* /*env*/,
                                                                             jclass /*type*/) {
    Jni::enter([](JNIEnv* /*env*/) {
        Talvox::Talvox::getInstance().setTalvoxSettings(boost::make_shared<Settings>());
    });
}

JNIEXPORT jobjectArray JNICALL Java_korvel_talvox_impl_SettingsProbe_engineKeys(JNIEnv* /*env*/,
                                                                                jclass /*type*/) {
    return findKeys(true);
}

JNIEXPORT jobjectArray JNICALL
Java_korvel_talvox_impl_SettingsProbe_recognitionKeys(JNIEnv* /*env*/, jclass /*type*/) {
    return findKeys(false);
}

}  // extern "C"
