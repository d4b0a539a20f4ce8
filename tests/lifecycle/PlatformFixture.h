/**
 * @file
 * What the tests of the platform recognizer share.
 */
#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "Device.h"
#include "PlatformLedger.h"
#include "ScriptedGateway.h"
#include "ScriptedTransport.h"
#include "core/util/EventLock.h"
#include "core/util/Time.h"
#include "pal/kd.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "talvox/Recognizer.h"
#include "talvox/Talvox.h"

namespace Lifecycle {

using Util::NS_PER_MS;
constexpr int LISTENING_LIMIT_MS = 30000;
constexpr int ANSWER_LIMIT_MS = 20000;

/** The platform recognizer with a device that speaks when asked to, also inside calls made to it.
 */
class PlatformFixture : public ::testing::Test,
                        public DeviceHost,
                        public GatewayObserver,
                        public Talvox::RecognizerListener {
  protected:
    PlatformFixture() : device(Device::make(*this)) {}

    void SetUp() override {
        if (!device) {
            GTEST_SKIP() << "built without the platform recognizer";
        }
        kdUseManualClockKOR(NS_PER_MS);
        ScriptedTransport::install();
        ScriptedGateway::instance().begin(plans, this);
        listener = makeListener();
        recognizer = create();
        // Uploads need an address.
        const auto engineSettings = boost::make_shared<Talvox::Settings>();
        engineSettings->putString(Talvox::Settings::SKS_URL, "http://gateway.invalid");
        engineSettings->putString(Talvox::Settings::SKS_UUID, "0123456789abcdef0123456789abcdef");
        engineSettings->putInt(Talvox::Settings::SKS_VERBOSE_LEVEL, 2);
        Talvox::Talvox::getInstance().setTalvoxSettings(engineSettings);
    }

    void TearDown() override {
        recognizer.reset();
        settle();
        Talvox::Talvox::getInstance().setTalvoxSettings(boost::make_shared<Talvox::Settings>());
        kdUseRealClockKOR();
    }

    boost::shared_ptr<Talvox::RecognizerListener> makeListener() {
        return boost::shared_ptr<Talvox::RecognizerListener>(
            static_cast<Talvox::RecognizerListener*>(this), [](Talvox::RecognizerListener*) {});
    }

    boost::shared_ptr<Talvox::Recognizer> create(
        const std::string& logging = Talvox::Settings::LOG_WITHOUT_SOUND_ALWAYS) {
        const auto settings = boost::make_shared<Talvox::Settings>();
        settings->putString(Talvox::Settings::RS_ASR_POLICY, Talvox::Settings::ASRP_PLATFORM_ONLY);
        settings->putString(Talvox::Settings::SKS_LOGGING_POLICY, logging);
        settings->putString(Talvox::Settings::SKS_SOUND_FORMAT,
                            Talvox::Settings::SOUND_FORMAT_SPEEX);
        settings->putString(Talvox::Settings::RS_SESSION_ID, ScriptedGateway::makeSessionId(0));
        return Talvox::Talvox::getInstance().createRecognizer(listener, settings);
    }

    void say(Saying what) {
        const Util::EventLock lock;
        device->say(handle, what, 0);
    }

    void failInCallback(const char* text) {
        const Util::EventLock lock;
        device->failInCallback(handle, text);
    }

    static void pass(int64_t milliseconds) {
        {
            const Util::EventLock lock;
            kdAdvanceClockKOR(milliseconds * NS_PER_MS);
        }
        settle();
    }

    /** Lets the gateway and the event thread do all that there is to do. */
    static void settle() {
        bool isBusy = true;
        while (isBusy) {
            ASSERT_TRUE(PlatformLedger::waitUntilIdle());
            const Util::EventLock lock;
            isBusy = ScriptedGateway::instance().turn();
        }
    }

    bool onDeviceMade(int64_t made) override {
        handle = made;
        if (speaksWhenMade) {
            say(Saying::RESULTS);
        }
        return !isRefused;
    }
    bool onDeviceAsked(int64_t /*made*/, const std::string& what) override {
        asked.push_back(what);
        return !whenAsked || whenAsked(what);
    }

    void onBody(int /*session*/, const std::string& /*body*/) override {}
    void onHead(int /*session*/, bool /*words*/) override {}
    void onAttemptEnd(int /*session*/, int code) override { attempts.push_back(code); }

    void onRecordingBegin(Talvox::Recognizer* /*caller*/) override {
        events.emplace_back("recordingBegin");
    }
    void onSpeakingBegin(Talvox::Recognizer* /*caller*/) override {
        events.emplace_back("speakingBegin");
    }
    void onRecordingDone(Talvox::Recognizer* /*caller*/) override {
        events.emplace_back("recordingDone");
        if (whenDone) {
            whenDone();
        }
    }
    void onBufferReceived(Talvox::Recognizer* /*caller*/,
                          const Sound::SoundDataBuffer& /*buffer*/) override {
        events.emplace_back("buffer");
    }
    void onPowerChanged(Talvox::Recognizer* /*caller*/, float /*power*/) override {
        events.emplace_back("power");
    }
    void onResults(Talvox::Recognizer* /*caller*/,
                   boost::shared_ptr<Talvox::Recognition> /*recognition*/) override {
        events.emplace_back("results");
    }
    void onError(Talvox::Recognizer* /*caller*/, Talvox::SpeechError error) override {
        events.push_back(error.getErrorString());
    }

    /** The session is over and its device cancelled; what the device says is ignored, the next
     * session has its results. */
    void expectNextWorks() {
        EXPECT_THAT(asked, ::testing::Contains("cancel"));
        const std::vector<std::string> before = events;
        for (const Saying what : {Saying::READY, Saying::LEVEL, Saying::END, Saying::RESULTS,
                                  Saying::NO_HYPOTHESIS, Saying::ERROR}) {
            say(what);
        }
        pass(LISTENING_LIMIT_MS);
        EXPECT_EQ(events, before);
        events.clear();
        recognizer = create();
        recognizer->start();
        say(Saying::RESULTS);
        EXPECT_THAT(events, ::testing::ElementsAre("results"));
    }

    std::vector<SessionPlan> plans{1};
    std::unique_ptr<Device> device;
    boost::shared_ptr<Talvox::RecognizerListener> listener;
    boost::shared_ptr<Talvox::Recognizer> recognizer;
    int64_t handle = 0;
    bool isRefused = false;
    bool speaksWhenMade = false;
    std::function<bool(const std::string&)> whenAsked;
    std::function<void()> whenDone;
    std::vector<std::string> events;
    std::vector<std::string> asked;
    std::vector<int> attempts;
    TestSupport::AssertCapture asserts;
    TestSupport::LogCapture log;
};

}  // namespace Lifecycle
