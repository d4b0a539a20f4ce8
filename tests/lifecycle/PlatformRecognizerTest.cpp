#include "PlatformFixture.h"

namespace {

using Lifecycle::ANSWER_LIMIT_MS;
using Lifecycle::LISTENING_LIMIT_MS;
using Lifecycle::NS_PER_MS;
using Lifecycle::Saying;
using Talvox::Settings;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

using PlatformRecognizerTest = Lifecycle::PlatformFixture;

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
