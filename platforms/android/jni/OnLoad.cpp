#include "EntryPoint.h"
#include "PlatformRecognizer.h"
#include "talvox/PlatformMechanism.h"

namespace {

/** Android's recogniser, as the facade sees it. */
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

void load(JNIEnv* env) {
    const Jni::LocalRef<jclass> application(env, env->FindClass("korvel/core/CoreApplication"));
    Jni::check(env);
    Jni::keepClassLoader(env, application.get());
    static auto* const mechanism = new AndroidMechanism;
    Talvox::PlatformMechanism::install(mechanism);
    const jmethodID onLibraryLoaded =
        Jni::findStaticMethod(env, application.get(), "onLibraryLoaded", "()V");
    env->CallStaticVoidMethod(application.get(), onLibraryLoaded);
    Jni::check(env);
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
