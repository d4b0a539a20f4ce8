// Entry points of korvel.talvox.impl.Talvox.
#include "BundleConversion.h"
#include "Engine.h"
#include "EntryPoint.h"
#include "Text.h"
#include "core/network/NetworkManager.h"

using Talvox::Settings;

namespace {

Jni::LocalRef<jobject> makeList(JNIEnv* env, const std::vector<std::string>& texts) {
    const Jni::LocalRef<jclass> type = Jni::findClass(env, "java/util/ArrayList");
    Jni::LocalRef<jobject> list = Jni::newObject(env, type.get(), "()V");
    for (const std::string& text : texts) {
        const Jni::LocalRef<jstring> entry = Jni::toJString(env, text);
        Jni::callBoolean(env, list.get(), "add", "(Ljava/lang/Object;)Z", entry.get());
    }
    return list;
}

}  // namespace

extern "C" {

JNIEXPORT jstring JNICALL Java_korvel_talvox_impl_Talvox_getVersion(JNIEnv* /*env*/,
                                                                    jclass /*type*/) {
    return Jni::enter<jstring>(nullptr, [](JNIEnv* env) {
        return Jni::toJString(env, Talvox::Talvox::VERSION).release();
    });
}

JNIEXPORT jlong JNICALL Java_korvel_talvox_impl_Talvox_getHandle(JNIEnv* /*env*/, jclass /*type*/) {
    return Jni::enter<jlong>(
        0, [](JNIEnv* /*env*/) { return Jni::toHandle(&Talvox::Talvox::getInstance()); });
}

JNIEXPORT jobject JNICALL Java_korvel_talvox_impl_Talvox_getSettings(JNIEnv* /*env*/,
                                                                     jclass /*type*/,
                                                                     jlong engine) {
    return Jni::enter<jobject>(nullptr, [engine](JNIEnv* env) {
        return bundleToJBundle(*Jni::getEngine(env, engine).getTalvoxSettings());
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_Talvox_updateSettings(JNIEnv* /*env*/,
                                                                     jclass /*type*/, jlong engine,
                                                                     jobject settings) {
    Jni::enter([engine, settings](JNIEnv* env) {
        Talvox::Talvox& facade = Jni::getEngine(env, engine);
        Jni::requireNonNull(env, settings, "settings");
        facade.setTalvoxSettings(Jni::makeSettings(
            facade, settings, "newSettings->conformsTo(Talvox::Settings::bundleSpecs)"));
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_Talvox_updateSettingsFromXml(JNIEnv* /*env*/,
                                                                            jclass /*type*/,
                                                                            jlong engine,
                                                                            jstring xml) {
    Jni::enter([engine, xml](JNIEnv* env) {
        Talvox::Talvox& facade = Jni::getEngine(env, engine);
        Jni::requireNonNull(env, xml, "xml");
        const boost::shared_ptr<Settings> settings = facade.getTalvoxSettings()->clone();
        settings->updateFromXml(Jni::toUtf8(env, xml), Settings::XML_PATH_DFLT,
                                Settings::bundleSpecs);
        facade.setTalvoxSettings(settings);
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_impl_Talvox_setCertificateFile(JNIEnv* /*env*/,
                                                                         jclass /*type*/,
                                                                         jstring path) {
    Jni::enter([path](JNIEnv* env) {
        Jni::requireNonNull(env, path, "path");
        Network::NetworkManager::getInstance().setCertificateFile(Jni::toUtf8(env, path));
    });
}

JNIEXPORT jboolean JNICALL Java_korvel_talvox_impl_Talvox_isRecognitionAvailable(JNIEnv* /*env*/,
                                                                                 jclass /*type*/,
                                                                                 jlong engine,
                                                                                 jobject settings) {
    return Jni::enter<jboolean>(JNI_FALSE, [engine, settings](JNIEnv* env) {
        const Talvox::Talvox& facade = Jni::getEngine(env, engine);
        Jni::requireNonNull(env, settings, "settings");
        const boost::shared_ptr<Settings> given = Jni::makeSettings(
            facade, settings, "settings->conformsTo(Talvox::Settings::bundleSpecs)");
        return static_cast<jboolean>(facade.isRecognitionAvailable(*given) ? JNI_TRUE : JNI_FALSE);
    });
}

JNIEXPORT jobject JNICALL Java_korvel_talvox_impl_Talvox_getAvailableLanguages(JNIEnv* /*env*/,
                                                                               jclass /*type*/,
                                                                               jlong engine) {
    return Jni::enter<jobject>(nullptr, [engine](JNIEnv* env) {
        return makeList(env, Jni::getEngine(env, engine).getAvailableLanguages()).release();
    });
}

}  // extern "C"
