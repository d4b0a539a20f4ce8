// Sessions of the platform recognizer that are interrupted by want of memory or threads, or by an
// exception: one end, nothing left behind, and the next session is right.
#include <dlfcn.h>

#include <stdexcept>

#include "PlatformFixture.h"
#include "support/AllocationFault.h"
#include "support/EndCounter.h"

namespace {

bool isWithoutThreads = false;

}  // namespace

// Stands in front of the platform layer's.
KDint kdStartEventsKOR() {
    static auto* const real =
        reinterpret_cast<decltype(&kdStartEventsKOR)>(dlsym(RTLD_NEXT, "kdStartEventsKOR"));
    return isWithoutThreads ? -1 : real();
}

namespace {

using Lifecycle::Saying;
using Talvox::Settings;
using Talvox::SpeechError;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::AllocationFault;
using TestSupport::EndCounter;

class PlatformScarcityTest : public Lifecycle::PlatformFixture {
  protected:
    ~PlatformScarcityTest() override { isWithoutThreads = false; }

    // Takes no memory.
    bool onDeviceAsked(int64_t made, const std::string& what) override {
        return counter || PlatformFixture::onDeviceAsked(made, what);
    }

    /** A session whose listener takes no memory. */
    void makeCountedSession(const std::string& logging) {
        counter = boost::make_shared<EndCounter>();
        listener = counter;
        recognizer = create(logging);
    }

    void expectOneEnd(int number) {
        EXPECT_EQ(counter->ends, 1) << "allocation " << number;
        EXPECT_THAT(Talvox::Talvox::getInstance().runningTaskHolders, IsEmpty());
        recognizer.reset();
    }

    void expectTheNextSessionIsRight() {
        counter.reset();
        events.clear();
        listener = makeListener();
        recognizer = create();
        recognizer->start();
        say(Saying::READY);
        say(Saying::RESULTS);
        EXPECT_THAT(events, ElementsAre("recordingBegin", "results"));
    }

    void failEachAllocationOfStart(AllocationFault::Extent extent);
    void failAllocationsOfASession(const std::string& logging, AllocationFault::Extent extent);

    boost::shared_ptr<EndCounter> counter;
};

void PlatformScarcityTest::failEachAllocationOfStart(AllocationFault::Extent extent) {
    int number = 0;
    for (bool failed = true; failed;) {
        makeCountedSession(Settings::LOG_WITH_SOUND_ALWAYS);
        {
            const AllocationFault fault(++number, extent);
            recognizer->start();
            failed = AllocationFault::hasHappened();
        }
        if (failed && counter->ends != 0) {
            EXPECT_EQ(counter->code, SpeechError::ErrorUnknown) << "allocation " << number;
        }
        if (counter->ends == 0) {
            recognizer->cancel();
        }
        expectOneEnd(number);
    }
    EXPECT_GT(number, 10);
    expectTheNextSessionIsRight();
}

TEST_F(PlatformScarcityTest, EachAllocationOfStartMayFail) {
    failEachAllocationOfStart(AllocationFault::ONE);
}

TEST_F(PlatformScarcityTest, AllAllocationsOfStartMayFailFromAnyOn) {
    failEachAllocationOfStart(AllocationFault::ALL_FROM_THERE_ON);
}

void PlatformScarcityTest::failAllocationsOfASession(const std::string& logging,
                                                     AllocationFault::Extent extent) {
    int number = 0;
    for (bool failed = true; failed;) {
        makeCountedSession(logging);
        recognizer->start();
        {
            const AllocationFault fault(++number, extent);
            for (const Saying what : {Saying::READY, Saying::BEGINNING, Saying::LEVEL,
                                      Saying::SOUND, Saying::PARTIAL, Saying::OTHER}) {
                say(what);
            }
            recognizer->stop();
            say(Saying::END);
            say(Saying::RESULTS);
            failed = AllocationFault::hasHappened();
        }
        settle();
        expectOneEnd(number);
    }
    EXPECT_GT(number, 10);
    expectTheNextSessionIsRight();
}

TEST_F(PlatformScarcityTest, EachAllocationOfASessionWithItsUploadMayFail) {
    failAllocationsOfASession(Settings::LOG_WITHOUT_SOUND_ALWAYS, AllocationFault::ONE);
}

TEST_F(PlatformScarcityTest, AllAllocationsOfASessionMayFailFromAnyOn) {
    failAllocationsOfASession(Settings::LOG_WITHOUT_SOUND_ALWAYS,
                              AllocationFault::ALL_FROM_THERE_ON);
}

TEST_F(PlatformScarcityTest, EachAllocationOfASessionThatEncodesItsUploadMayFail) {
    failAllocationsOfASession(Settings::LOG_WITH_SOUND_ALWAYS, AllocationFault::ONE);
}

TEST_F(PlatformScarcityTest, AnUploadThatCannotBeMadeCostsNoResults) {
    bool isUploadLost = false;
    int number = 0;
    for (bool failed = true; failed;) {
        makeCountedSession(Settings::LOG_WITHOUT_SOUND_ALWAYS);
        recognizer->start();
        log.clear();
        {
            const AllocationFault fault(++number, AllocationFault::ONE);
            say(Saying::RESULTS);
            failed = AllocationFault::hasHappened();
        }
        if (log.contains("PlatformRecognizer: nothing is logged: std::bad_alloc")) {
            isUploadLost = true;
            EXPECT_EQ(counter->code, -1) << "allocation " << number;
        }
        settle();
        expectOneEnd(number);
    }
    EXPECT_TRUE(isUploadLost);
}

TEST_F(PlatformScarcityTest, StartWithoutAThreadForTheEngineIsOneErrorAndTheNextOneWorks) {
    isWithoutThreads = true;
    recognizer->start();
    isWithoutThreads = false;
    EXPECT_THAT(events, ElementsAre("ErrorUnknown"));
    EXPECT_EQ(recognizer->getErrorReason(), "the system has no thread for the engine");
    EXPECT_THAT(asked, IsEmpty());
    expectTheNextSessionIsRight();
}

TEST_F(PlatformScarcityTest, ACallbackThatFailsIsOneErrorAndCancelsTheDevice) {
    recognizer->start();
    failInCallback("broken");
    EXPECT_THAT(events, ElementsAre("ErrorUnknown"));
    EXPECT_EQ(recognizer->getErrorReason(), "broken");
    expectNextWorks();
}

TEST_F(PlatformScarcityTest, ACallbackThatFailsLeavesResultsThatWaitForTheirUpload) {
    recognizer = create(Settings::LOG_WITH_SOUND_ALWAYS);
    recognizer->start();
    {
        const Util::EventLock lock;
        say(Saying::SOUND);
        say(Saying::RESULTS);
        EXPECT_THAT(events, IsEmpty());
        failInCallback("broken");
        EXPECT_THAT(events, ElementsAre("results"));
    }
    settle();
    EXPECT_THAT(events, ElementsAre("results"));
}

TEST_F(PlatformScarcityTest, AListenerThatThrowsEndsTheSession) {
    whenDone = [] { throw std::runtime_error("broken"); };
    recognizer->start();
    say(Saying::END);
    EXPECT_THAT(events, ElementsAre("recordingDone", "ErrorUnknown"));
    EXPECT_EQ(recognizer->getErrorReason(), "broken");
    whenDone = nullptr;
    expectNextWorks();
}

TEST_F(PlatformScarcityTest, AnExceptionOfAnotherCallbackEndsTheActiveSession) {
    recognizer->start();
    kdPostKOR([](void*) { throw std::runtime_error("broken elsewhere"); }, nullptr);
    kdDrainEventsKOR();
    EXPECT_THAT(events, ElementsAre("ErrorUnknown"));
    EXPECT_EQ(recognizer->getErrorReason(), "broken elsewhere");
    expectNextWorks();
}

TEST_F(PlatformScarcityTest, AnExceptionOfAnotherCallbackLeavesASessionThatIsOverAlone) {
    recognizer->start();
    recognizer->cancel();
    kdPostKOR([](void*) { throw std::runtime_error("broken elsewhere"); }, nullptr);
    kdDrainEventsKOR();
    EXPECT_THAT(events, ElementsAre("ErrorCanceled"));
}

}  // namespace
