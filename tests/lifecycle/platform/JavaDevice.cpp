#include <boost/make_shared.hpp>
#include <stdexcept>

#include "Device.h"
#include "JavaDouble.h"
#include "ScriptedGateway.h"
#include "platforms/android/jni/Handles.h"
#include "platforms/android/jni/PlatformRecognizer.h"
#include "talvox/PlatformMechanism.h"

namespace Lifecycle {

namespace {

using Talvox::RecognitionResult;
using Talvox::RecognitionResults;

class Mechanism : public Talvox::PlatformMechanism {
  public:
    bool isRecognitionAvailable() override { return true; }
    std::vector<std::string> getAvailableLanguages() override { return {}; }
    boost::shared_ptr<Talvox::Recognizer> createRecognizer(
        const Talvox::Talvox* facade,
        const boost::shared_ptr<const Talvox::Settings>& settings) override {
        return ::PlatformRecognizer::create(facade, settings);
    }
};

class JavaDevice : public Device {
  public:
    explicit JavaDevice(DeviceHost& host) : java(host) {
        Talvox::PlatformMechanism::install(&mechanism);
    }
    ~JavaDevice() override { Talvox::PlatformMechanism::install(nullptr); }
    JavaDevice(const JavaDevice&) = delete;
    JavaDevice& operator=(const JavaDevice&) = delete;

    void say(int64_t handle, Saying what, int session) override;
    void failInCallback(int64_t handle, const char* text) override;
    long countReferences() const override { return java.countReferences(); }

  private:
    static void callBack(::PlatformRecognizer& recognizer, Saying what, int session);

    JavaDouble java;
    Mechanism mechanism;
};

// As the callbacks from Java do.
void JavaDevice::say(int64_t handle, Saying what, int session) {
    if (const auto recognizer = Jni::KnownObjects<::PlatformRecognizer>::find(handle)) {
        recognizer->enter([&] { callBack(*recognizer, what, session); });
    }
}

void JavaDevice::failInCallback(int64_t handle, const char* text) {
    if (const auto recognizer = Jni::KnownObjects<::PlatformRecognizer>::find(handle)) {
        recognizer->enter([text] { throw std::runtime_error(text); });
    }
}

void JavaDevice::callBack(::PlatformRecognizer& recognizer, Saying what, int session) {
    static const char SOUND[320] = {};
    const auto results = boost::make_shared<RecognitionResults>();
    results->emplace_back(ScriptedGateway::makeWords(session),
                          RecognitionResult::UNKNOWN_CONFIDENCE);
    switch (what) {
        case Saying::NOTHING:
            break;
        case Saying::READY:
            recognizer.onReadyForSpeech();
            break;
        case Saying::BEGINNING:
            recognizer.onBeginningOfSpeech();
            break;
        case Saying::LEVEL:
            recognizer.onRmsChanged(1);
            break;
        case Saying::SOUND:
            recognizer.onBufferReceived(SOUND, sizeof(SOUND));
            break;
        case Saying::END:
            recognizer.onEndOfSpeech();
            break;
        case Saying::PARTIAL:
            recognizer.onPartialResults(results);
            break;
        case Saying::RESULTS:
            recognizer.onResults(results);
            break;
        case Saying::NO_HYPOTHESIS:
            recognizer.onError(-1);
            break;
        case Saying::ERROR:
            recognizer.onError(DEVICE_ERROR);
            break;
        case Saying::OTHER:
            recognizer.onEvent();
            break;
    }
}

}  // namespace

std::unique_ptr<Device> Device::make(DeviceHost& host) {
    return std::make_unique<JavaDevice>(host);
}

}  // namespace Lifecycle
