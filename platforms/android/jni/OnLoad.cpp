#include "EntryPoint.h"
#include "PlatformRecognizer.h"
#include "pal/kd_log.h"
#include "talvox/PlatformMechanism.h"

namespace {

/** Android's recognizer, as the facade sees it. */
class AndroidMechanism : public Talvox::PlatformMechanism {
  public:
    bool isRecognitionAvailable() override { return PlatformRecognizer::isRecognitionAvailable(); }
    std::vector<std::string> getAvailableLanguages() override {
        return PlatformRecognizer::getAvailableLanguages();
    }
    boost::shared_ptr<Talvox::Recognizer> createRecognizer(
        const Talvox::Talvox* facade,
        const boost::shared_ptr<const Talvox::Settings>& settings) override {
        return PlatformRecognizer::create(facade, settings);
    }
};

const char* const APPLICATION = "korvel/core/CoreApplication";

/** One of these is of the application that loads the library; it need not have all of them. */
const char* const KNOWN_CLASSES[] = {APPLICATION,
                                     "korvel/talvox/impl/Talvox",
                                     "korvel/talvox/impl/Recognizer",
                                     "korvel/talvox/impl/PlatformRecognizer",
                                     "korvel/talvox/util/LogCollector",
                                     "korvel/talvox/proximity/ProximityGestureRecognizer"};

void keepClassLoader(JNIEnv* env) {
    for (const char* const name : KNOWN_CLASSES) {
        try {
            const Jni::LocalRef<jclass> type = Jni::findClass(env, name);
            Jni::keepClassLoader(env, type.get());
            return;
        } catch (const Jni::PendingException&) {
            env->ExceptionClear();
        }
    }
    kdLogFormatMessage("JNI_OnLoad: none of the classes with native methods is there");
}

/** Without the back ends the library records, logs and watches the network by its own means. */
void announce(JNIEnv* env) {
    try {
        const Jni::LocalRef<jclass> application = Jni::findClass(env, APPLICATION);
        const jmethodID onLibraryLoaded =
            Jni::findStaticMethod(env, application.get(), "onLibraryLoaded", "()V");
        env->CallStaticVoidMethod(application.get(), onLibraryLoaded);
        Jni::check(env);
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, "CoreApplication.onLibraryLoaded, the back ends in Java stay off");
    }
}

void load(JNIEnv* env) {
    keepClassLoader(env);
    static auto* const mechanism = new AndroidMechanism;
    Talvox::PlatformMechanism::install(mechanism);
    announce(env);
}

}  // namespace

extern "C" JNIEXPORT jint JNICALL JNI_OnLoad(JavaVM* vm, void* /*reserved*/) {
    kdSetJavaVMKOR(vm);
    const bool isLoaded = Jni::enter<bool>(false, [](JNIEnv* env) {
        load(env);
        return true;
    });
    return isLoaded ? JNI_VERSION_1_6 : JNI_ERR;
}
