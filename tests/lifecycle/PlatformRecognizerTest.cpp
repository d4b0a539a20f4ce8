#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <functional>
#include <string>
#include <vector>

#include "Device.h"
#include "PlatformLedger.h"
#include "ScriptedGateway.h"
#include "core/network/NetworkManager.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "talvox/RecognizerListenerAdapter.h"
#include "talvox/Talvox.h"

namespace {

using Lifecycle::PlatformLedger;
using Lifecycle::Saying;
using Lifecycle::ScriptedGateway;
using Talvox::Settings;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

const int64_t NS_PER_MS = 1000000;
const int LISTENING_LIMIT_MS = 30000;
const int ANSWER_LIMIT_MS = 20000;

/** The platform recognizer with a device that speaks when asked to, also inside calls made to it.
 */
class PlatformRecognizerTest : public ::testing::Test,
                               public Lifecycle::DeviceHost,
                               public Lifecycle::GatewayObserver,
                               public Talvox::RecognizerListener {
  protected:
    PlatformRecognizerTest() : device(Lifecycle::Device::make(*this)) {}

    void SetUp() override {
        if (!device) {
            GTEST_SKIP() << "built without the platform recognizer";
        }
        kdUseManualClockKOR(NS_PER_MS);
        Network::NetworkManager::getInstance().getTransport();
        ScriptedGateway::instance().begin(plans, this);
        listener = boost::shared_ptr<Talvox::RecognizerListener>(
            static_cast<Talvox::RecognizerListener*>(this), [](Talvox::RecognizerListener*) {});
        recognizer = create();
        // Uploads need an address.
        const auto engineSettings = boost::make_shared<Settings>();
        engineSettings->putString(Settings::SKS_URL, "http://gateway.invalid");
        engineSettings->putString(Settings::SKS_UUID, "0123456789abcdef0123456789abcdef");
        engineSettings->putInt(Settings::SKS_VERBOSE_LEVEL, 2);
        Talvox::Talvox::getInstance().setTalvoxSettings(engineSettings);
    }

    void TearDown() override {
        recognizer.reset();
        settle();
        Talvox::Talvox::getInstance().setTalvoxSettings(boost::make_shared<Settings>());
        kdUseRealClockKOR();
    }

    boost::shared_ptr<Talvox::Recognizer> create(
        const std::string& logging = Settings::LOG_WITHOUT_SOUND_ALWAYS) {
        const auto settings = boost::make_shared<Settings>();
        settings->putString(Settings::RS_ASR_POLICY, Settings::ASRP_PLATFORM_ONLY);
        settings->putString(Settings::SKS_LOGGING_POLICY, logging);
        settings->putString(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
        settings->putString(Settings::RS_SESSION_ID, ScriptedGateway::makeSessionId(0));
        return Talvox::Talvox::getInstance().createRecognizer(listener, settings);
    }

    void say(Saying what) {
        const Util::EventLock lock;
        device->say(handle, what, 0);
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
        EXPECT_THAT(events, ElementsAre("results"));
    }

    std::vector<Lifecycle::SessionPlan> plans{1};
    std::unique_ptr<Lifecycle::Device> device;
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

TEST_F(PlatformRecognizerTest, ResultsFromInsideCancelDoNotCount) {
    whenAsked = [this](const std::string& what) {
        if (what == "cancel") {
            device->say(handle, Saying::RESULTS, 0);
        }
        return true;
    };
    recognizer->start();
    recognizer->cancel();
    EXPECT_THAT(events, ElementsAre("ErrorCanceled"));
    EXPECT_THAT(asserts.reports(), IsEmpty());
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
    EXPECT_THAT(events, ElementsAre("recordingDone", "ErrorCanceled"));
    EXPECT_THAT(asserts.reports(), IsEmpty());
}

TEST_F(PlatformRecognizerTest, ADeviceThatIsSilentWhileItListensEndsTheSession) {
    recognizer->start();
    pass(LISTENING_LIMIT_MS - 1);
    EXPECT_THAT(events, IsEmpty());
    pass(1);
    EXPECT_THAT(events, ElementsAre("ErrorNetwork"));
    EXPECT_EQ(recognizer->getErrorReason(), "no callback of the device recognizer for 30 s");
    expectNextWorks();
}

TEST_F(PlatformRecognizerTest, EveryCallbackIsASignOfLife) {
    recognizer->start();
    for (const Saying what : {Saying::READY, Saying::BEGINNING, Saying::LEVEL, Saying::SOUND,
                              Saying::PARTIAL, Saying::OTHER}) {
        pass(LISTENING_LIMIT_MS - 1);
        say(what);
    }
    EXPECT_THAT(events, ElementsAre("recordingBegin", "speakingBegin", "power"));
    pass(LISTENING_LIMIT_MS - 1);
    EXPECT_EQ(events.size(), 3U);
    pass(1);
    EXPECT_THAT(events.back(), "ErrorNetwork");
}

TEST_F(PlatformRecognizerTest, ADeviceThatDoesNotAnswerAfterStopEndsTheSession) {
    recognizer->start();
    pass(LISTENING_LIMIT_MS - 1);
    recognizer->stop();
    // Neither callbacks nor further calls prolong it.
    pass(ANSWER_LIMIT_MS - 1);
    say(Saying::LEVEL);
    say(Saying::PARTIAL);
    say(Saying::END);
    recognizer->stop();
    EXPECT_THAT(events, ElementsAre("power", "recordingDone"));
    pass(1);
    EXPECT_THAT(events, ElementsAre("power", "recordingDone", "ErrorNetwork"));
    EXPECT_EQ(recognizer->getErrorReason(), "no answer of the device recognizer within 20 s");
    expectNextWorks();
}

TEST_F(PlatformRecognizerTest, ADeviceThatDoesNotAnswerAfterTheEndOfSpeechEndsTheSession) {
    recognizer->start();
    say(Saying::END);
    pass(ANSWER_LIMIT_MS - 1);
    recognizer->stop();
    EXPECT_THAT(events, ElementsAre("recordingDone"));
    pass(1);
    EXPECT_THAT(events, ElementsAre("recordingDone", "ErrorNetwork"));
    expectNextWorks();
}

TEST_F(PlatformRecognizerTest, AnEndStopsTheClock) {
    for (const Saying what : {Saying::RESULTS, Saying::NO_HYPOTHESIS, Saying::ERROR}) {
        events.clear();
        recognizer = create();
        recognizer->start();
        say(what);
        pass(LISTENING_LIMIT_MS);
        EXPECT_EQ(events.size(), 1U);
    }
}

TEST_F(PlatformRecognizerTest, ResultsThatWaitForTheEncoderAreNotSilence) {
    recognizer = create(Settings::LOG_WITH_SOUND_ALWAYS);
    recognizer->start();
    {
        // From before the sound on, so that the encoder cannot report its end.
        const Util::EventLock lock;
        say(Saying::SOUND);
        recognizer->stop();
        say(Saying::RESULTS);
        EXPECT_THAT(events, IsEmpty());
        kdAdvanceClockKOR(LISTENING_LIMIT_MS * NS_PER_MS);
    }
    settle();
    EXPECT_THAT(events, ElementsAre("results"));
}

TEST_F(PlatformRecognizerTest, CancelOnAnIdleRecognizerIsReportedOnce) {
    recognizer->cancel();
    recognizer->cancel();
    EXPECT_THAT(events, ElementsAre("ErrorCanceled"));
    EXPECT_THAT(asked, IsEmpty());
}

TEST_F(PlatformRecognizerTest, PartialResultsReachNoListener) {
    recognizer->start();
    say(Saying::PARTIAL);
    EXPECT_THAT(events, IsEmpty());
    say(Saying::RESULTS);
    EXPECT_THAT(events, ElementsAre("results"));
}

TEST_F(PlatformRecognizerTest, LogsHowLongTheRequestTook) {
    recognizer->start();
    pass(500);
    recognizer->stop();
    pass(1234);
    say(Saying::RESULTS);
    EXPECT_EQ(log.count("Request finished in 1234 msec"), 1U);

    recognizer = create();
    recognizer->start();
    say(Saying::END);
    pass(77);
    say(Saying::NO_HYPOTHESIS);
    EXPECT_EQ(log.count("Request finished with empty results in 77 msec"), 1U);
    EXPECT_FALSE(log.containsPart("Request failed"));
}

TEST_F(PlatformRecognizerTest, LogsAFailedRequestOnceListeningHasEnded) {
    recognizer->start();
    say(Saying::ERROR);
    EXPECT_FALSE(log.containsPart("Request failed"));

    recognizer = create();
    recognizer->start();
    say(Saying::END);
    pass(250);
    say(Saying::ERROR);
    EXPECT_EQ(log.count("Request failed in 250 msec"), 1U);
    EXPECT_THAT(events, ElementsAre("ErrorServer", "recordingDone", "ErrorServer"));
}

TEST_F(PlatformRecognizerTest, AnUploadThatFailsIsNotSentAgain) {
    plans[0].attempts.assign(2, {});
    plans[0].attempts[0].reply = Lifecycle::Reply::FAILURE;
    recognizer->start();
    say(Saying::RESULTS);
    settle();
    pass(60000);
    EXPECT_THAT(events, ElementsAre("results"));
    EXPECT_THAT(attempts, ElementsAre(503));
    EXPECT_TRUE(log.containsPart("SelfFinishingTaskHolder:selfFinish"));
    EXPECT_THAT(Talvox::Talvox::getInstance().runningTaskHolders, IsEmpty());
}

TEST_F(PlatformRecognizerTest, ADeviceThatCannotBeMadeIsReportedAndNotAvailable) {
    isRefused = true;
    recognizer->start();
    EXPECT_THAT(events, ElementsAre("ErrorNotAvailable"));
    ASSERT_EQ(asserts.count(), 1U);
    EXPECT_EQ(asserts.reports()[0].condition, "jobj");
    EXPECT_EQ(asserts.reports()[0].path, "platforms/android/jni/PlatformRecognizer");
}

TEST_F(PlatformRecognizerTest, ResultsWithoutAnObjectReportItAndArrive) {
    whenAsked = [](const std::string& what) {
        ADD_FAILURE() << what << " of an object that is not there yet";
        return true;
    };
    speaksWhenMade = true;
    recognizer->start();
    EXPECT_THAT(events, ElementsAre("results"));
    // The source, the language and the model.
    ASSERT_EQ(asserts.count(), 3U);
    EXPECT_EQ(asserts.reports()[0].condition, "jobj");
    EXPECT_EQ(asserts.reports()[0].path, "platforms/android/jni/PlatformRecognizer");
    whenAsked = nullptr;
}

TEST_F(PlatformRecognizerTest, ASecondSessionIsBusyUntilTheFirstIsCancelled) {
    recognizer->start();
    const boost::shared_ptr<Talvox::Recognizer> second = create();
    second->start();
    EXPECT_THAT(events, ElementsAre("ErrorBusy"));
    EXPECT_EQ(second->getErrorReason(), "another session is active");
    recognizer->cancel();
    EXPECT_THAT(events, ElementsAre("ErrorBusy", "ErrorCanceled"));
    EXPECT_EQ(recognizer->getErrorReason(), "the application cancelled");
    expectNextWorks();
}

TEST_F(PlatformRecognizerTest, AStopThatFailsIsOneErrorAndCancelsTheDevice) {
    whenAsked = [](const std::string& what) { return what != "stop"; };
    recognizer->start();
    recognizer->stop();
    EXPECT_THAT(events, ElementsAre("ErrorUnknown"));
    EXPECT_EQ(recognizer->getErrorReason(), "the device recognizer could not be stopped");
    EXPECT_THAT(asked, ElementsAre("start", "stop", "cancel"));
    expectNextWorks();
}

}  // namespace
