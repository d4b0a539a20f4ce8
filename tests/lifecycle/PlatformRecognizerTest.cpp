#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <functional>
#include <string>
#include <vector>

#include "Device.h"
#include "support/AssertCapture.h"
#include "talvox/RecognizerListenerAdapter.h"
#include "talvox/Talvox.h"

namespace {

using Lifecycle::Saying;
using Talvox::Settings;

/** The platform recognizer with a device that speaks from inside the calls made to it. */
class PlatformRecognizerTest : public ::testing::Test,
                               public Lifecycle::DeviceHost,
                               public Talvox::RecognizerListenerAdapter {
  protected:
    PlatformRecognizerTest() : device(Lifecycle::Device::make(*this)) {}

    void SetUp() override {
        if (!device) {
            GTEST_SKIP() << "built without the platform recognizer";
        }
        const auto settings = boost::make_shared<Settings>();
        settings->putString(Settings::RS_ASR_POLICY, Settings::ASRP_PLATFORM_ONLY);
        settings->putString(Settings::SKS_LOGGING_POLICY, Settings::LOG_WITHOUT_SOUND_ALWAYS);
        listener = boost::shared_ptr<Talvox::RecognizerListener>(
            static_cast<Talvox::RecognizerListener*>(this), [](Talvox::RecognizerListener*) {});
        recognizer = Talvox::Talvox::getInstance().createRecognizer(listener, settings);
        // Uploads need an address.
        const auto engineSettings = boost::make_shared<Settings>();
        engineSettings->putString(Settings::SKS_URL, "http://gateway.invalid");
        engineSettings->putString(Settings::SKS_UUID, "0123456789abcdef0123456789abcdef");
        Talvox::Talvox::getInstance().setTalvoxSettings(engineSettings);
    }

    void TearDown() override {
        recognizer.reset();
        Talvox::Talvox::getInstance().setTalvoxSettings(boost::make_shared<Settings>());
    }

    bool onDeviceMade(int64_t made) override {
        handle = made;
        return true;
    }
    bool onDeviceAsked(int64_t /*made*/, const std::string& what) override {
        return !whenAsked || whenAsked(what);
    }
    void onRecordingDone(Talvox::Recognizer* /*caller*/) override {
        events.emplace_back("recordingDone");
        if (whenDone) {
            whenDone();
        }
    }
    void onResults(Talvox::Recognizer* /*caller*/,
                   boost::shared_ptr<Talvox::Recognition> /*recognition*/) override {
        events.emplace_back("results");
    }
    void onError(Talvox::Recognizer* /*caller*/, Talvox::SpeechError error) override {
        events.push_back(error.getErrorString());
    }

    std::unique_ptr<Lifecycle::Device> device;
    boost::shared_ptr<Talvox::RecognizerListener> listener;
    boost::shared_ptr<Talvox::Recognizer> recognizer;
    int64_t handle = 0;
    std::function<bool(const std::string&)> whenAsked;
    std::function<void()> whenDone;
    std::vector<std::string> events;
    TestSupport::AssertCapture asserts;
};

TEST_F(PlatformRecognizerTest, ResultsFromInsideCancelDoNotCount) {
    whenAsked = [this](const std::string& what) {
        if (what == "cancel") {
            device->say(handle, Saying::RESULTS, 0);
        }
        return true;
    };
    recognizer->start();
    recognizer->cancel();
    EXPECT_THAT(events, ::testing::ElementsAre("ErrorCanceled"));
    EXPECT_THAT(asserts.reports(), ::testing::IsEmpty());
}

TEST_F(PlatformRecognizerTest, CancelInsideAStartThatFailsAfterwards) {
    whenAsked = [this](const std::string& what) {
        if (what == "start") {
            device->say(handle, Saying::END, 0);
        }
        return what != "start";
    };
    whenDone = [this] { recognizer->cancel(); };
    recognizer->start();
    EXPECT_THAT(events, ::testing::ElementsAre("recordingDone", "ErrorCanceled"));
    EXPECT_THAT(asserts.reports(), ::testing::IsEmpty());
}

}  // namespace
