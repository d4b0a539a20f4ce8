// Built against the installed headers and libraries only, as an application would be.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <boost/pointer_cast.hpp>
#include <string>
#include <vector>

#include "core/sound/FileRecorder.h"
#include "libs/webrtc_vad.h"
#include "pal/kd.h"
#include "talvox/RecognizerListenerAdapter.h"
#include "talvox/Talvox.h"
#include "util/WavOutputStream.h"

using ::testing::ElementsAre;
using ::testing::HasSubstr;

namespace {

class EventLog : public Talvox::RecognizerListenerAdapter {
  public:
    std::vector<std::string> events;

    void onRecordingBegin(Talvox::Recognizer*) override { events.emplace_back("recordingBegin"); }
    void onSpeakingBegin(Talvox::Recognizer*) override { events.emplace_back("speakingBegin"); }
    void onRecordingDone(Talvox::Recognizer*) override { events.emplace_back("recordingDone"); }
    void onResults(Talvox::Recognizer*, boost::shared_ptr<Talvox::Recognition>) override {
        events.emplace_back("results");
    }
    void onError(Talvox::Recognizer*, Talvox::SpeechError error) override {
        events.push_back(error.getErrorString());
    }
};

boost::shared_ptr<Talvox::Settings> usableSettings() {
    auto settings = boost::make_shared<Talvox::Settings>();
    settings->putString(Talvox::Settings::SKS_URL, "http://127.0.0.1:1");
    settings->putString(Talvox::Settings::SKS_UUID, "0123456789abcdef0123456789abcdef");
    return settings;
}

class InstalledPackage : public ::testing::Test {
  protected:
    InstalledPackage() {
        kdUseManualClockKOR(0);
        Sound::Recorder::setFactory(
            [] { return boost::make_shared<Sound::FileRecorder>(std::vector<int16_t>()); });
    }
    ~InstalledPackage() override {
        Sound::Recorder::setFactory({});
        kdUseRealClockKOR();
    }
};

}  // namespace

TEST_F(InstalledPackage, TellsItsVersion) {
    EXPECT_EQ("133", Talvox::Talvox::VERSION);
}

TEST_F(InstalledPackage, SilentSessionEndsInNoVoiceAfterFiveSeconds) {
    auto& engine = Talvox::Talvox::getInstance();
    engine.setTalvoxSettings(usableSettings());
    auto listener = boost::make_shared<EventLog>();
    auto recognizer = engine.createRecognizer(listener, usableSettings());

    recognizer->start();
    kdAdvanceClockKOR(4900LL * 1000 * 1000);
    EXPECT_THAT(listener->events, ElementsAre("recordingBegin"));
    kdAdvanceClockKOR(200LL * 1000 * 1000);
    EXPECT_THAT(listener->events, ElementsAre("recordingBegin", "ErrorNoVoice"));
}

TEST_F(InstalledPackage, CancelFromTheApplicationIsReportedOnce) {
    auto& engine = Talvox::Talvox::getInstance();
    engine.setTalvoxSettings(usableSettings());
    auto listener = boost::make_shared<EventLog>();
    auto recognizer = engine.createRecognizer(listener, usableSettings());

    recognizer->start();
    recognizer->cancel();
    recognizer->cancel();
    EXPECT_THAT(listener->events, ElementsAre("ErrorCanceled"));
}

TEST_F(InstalledPackage, ErrorsOfTheRecognizerClassesCrossTheLibraryBoundary) {
    auto settings = usableSettings();
    settings->putString(Talvox::Settings::RS_ASR_POLICY, Talvox::Settings::ASRP_DISABLED);
    auto listener = boost::make_shared<EventLog>();
    auto recognizer = Talvox::Talvox::getInstance().createRecognizer(listener, settings);
    recognizer->start();
    EXPECT_THAT(listener->events, ElementsAre("ErrorNotAvailable"));
    EXPECT_EQ(nullptr, boost::dynamic_pointer_cast<Sound::RecorderListener>(recognizer));
}

TEST_F(InstalledPackage, SettingsTreeIsUsable) {
    Talvox::Settings settings;
    settings.updateFromXml("<a><b><Sample_Rate>0x3E80</Sample_Rate></b></a>", "/a/b",
                           Talvox::Settings::bundleSpecs);
    EXPECT_EQ(16000, settings.getInt(Talvox::Settings::SKS_SAMPLE_RATE));
    EXPECT_THAT(settings.toXmlString("settings"), HasSubstr("<samplerate>16000</samplerate>\n"));
}

TEST_F(InstalledPackage, DetectorLibraryIsUsable) {
    VadInst* detector = nullptr;
    ASSERT_EQ(0, WebRtcVad_Create(&detector));
    EXPECT_EQ(0, WebRtcVad_Init(detector));
    const std::vector<int16_t> silence(160, 0);
    EXPECT_EQ(0, WebRtcVad_Process(detector, 16000, silence.data(), 160));
    EXPECT_EQ(0, WebRtcVad_Free(detector));
}
