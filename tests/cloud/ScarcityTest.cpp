// Sessions for which the system lacks threads or memory, and sessions that are interrupted by an
// exception: one end, nothing left behind, and the next session is right.
#include <dlfcn.h>
#include <gmock/gmock.h>

#include <atomic>
#include <boost/make_shared.hpp>
#include <new>
#include <stdexcept>
#include <string>

#include "SessionTest.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "support/AllocationFault.h"
#include "support/LogCapture.h"

namespace {

bool isWithoutThreads = false;
std::atomic<bool> isWithoutMemoryForOgg{false};

}  // namespace

// Stands in front of the platform layer's.
KDint kdStartEventsKOR() {
    static auto* const real =
        reinterpret_cast<decltype(&kdStartEventsKOR)>(dlsym(RTLD_NEXT, "kdStartEventsKOR"));
    return isWithoutThreads ? -1 : real();
}

// Stands in front of libogg's.
extern "C" __attribute__((visibility("default"))) int ogg_stream_init(void* stream, int number) {
    using Init = int (*)(void*, int);
    static const auto real = reinterpret_cast<Init>(dlsym(RTLD_NEXT, "ogg_stream_init"));
    return isWithoutMemoryForOgg ? -1 : real(stream, number);
}

namespace {

using CloudTest::EventRecorder;
using CloudTest::Texts;
using Talvox::Settings;
using TestSupport::AllocationFault;

/** Counts the terminal events, without any memory of its own. */
class EndCounter : public Talvox::RecognizerListener {
  public:
    void onRecordingBegin(Talvox::Recognizer* /*recognizer*/) override {}
    void onSpeakingBegin(Talvox::Recognizer* /*recognizer*/) override {}
    void onRecordingDone(Talvox::Recognizer* /*recognizer*/) override {}
    void onBufferReceived(Talvox::Recognizer* /*recognizer*/,
                          const Sound::SoundDataBuffer& /*buffer*/) override {}
    void onPowerChanged(Talvox::Recognizer* /*recognizer*/, float /*power*/) override {}
    void onResults(Talvox::Recognizer* /*recognizer*/,
                   boost::shared_ptr<Talvox::Recognition> /*recognition*/) override {
        ++ends;
    }
    void onError(Talvox::Recognizer* /*recognizer*/, Talvox::SpeechError error) override {
        ++ends;
        code = error.getCode();
    }

    int ends = 0;
    int code = -1;
};

class ScarcityTest : public CloudTest::SessionTest {
  protected:
    ScarcityTest() {
        configure([](Settings& settings) {
            settings.putString(Settings::SKS_VAD_SETTINGS, CloudTest::SHORT_SPEECH);
        });
    }

    ~ScarcityTest() override {
        isWithoutThreads = false;
        isWithoutMemoryForOgg = false;
    }

    void expectTheNextSessionIsRight() {
        startSession();
        play(2000);
        ASSERT_TRUE(events->waitForEnds());
        EXPECT_EQ(events->texts(),
                  Texts({"recordingBegin", "speakingBegin", "recordingDone", "results"}));
        EXPECT_TRUE(isEngineFree());
    }

    /** A session whose listener takes no memory. */
    boost::shared_ptr<EndCounter> makeCountedSession() {
        auto counter = boost::make_shared<EndCounter>();
        session = engine().createRecognizer(counter, boost::make_shared<Settings>());
        return counter;
    }

    /** Cancels what has not ended, and looks for what must not be left. */
    void expectOneEnd(EndCounter& counter) {
        if (counter.ends == 0) {
            session->cancel();
        }
        EXPECT_EQ(counter.ends, 1);
        EXPECT_TRUE(isEngineFree());
        if (recorder) {
            EXPECT_FALSE(recorder->isRecording());
        }
        session.reset();
    }

    void failEachAllocationOfStart(AllocationFault::Extent extent);
    void failAllocationsOfASession(bool streaming, const std::string& format);

    TestSupport::LogCapture log;
};

TEST_F(ScarcityTest, StartWithoutAThreadForTheEngineIsOneErrorAndTheNextOneWorks) {
    isWithoutThreads = true;
    startSession();
    EXPECT_EQ(events->texts(), Texts({"error ErrorUnknown"}));
    EXPECT_EQ(events->errorReason(), "the system has no thread for the engine");
    EXPECT_EQ(recorder, nullptr);
    EXPECT_TRUE(isEngineFree());
    isWithoutThreads = false;
    expectTheNextSessionIsRight();
}

TEST_F(ScarcityTest, SoundThatCannotBeEncodedIsOneErrorAndTheNextSessionWorks) {
    for (const bool streaming : {false, true}) {
        configure([streaming](Settings& settings) {
            settings.putBoolean(Settings::SKS_STREAMING, streaming);
            settings.putString(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
        });
        isWithoutMemoryForOgg = true;
        startSession();
        play(100);
        EXPECT_TRUE(events->waitForEnds());
        isWithoutMemoryForOgg = false;
        EXPECT_EQ(events->texts(), Texts({"error ErrorEncoding"}));
        EXPECT_EQ(events->errorReason(), "the sound could not be encoded");
        EXPECT_FALSE(recorder->isRecording());
        EXPECT_TRUE(isEngineFree());
        expectTheNextSessionIsRight();
    }
}

void ScarcityTest::failEachAllocationOfStart(AllocationFault::Extent extent) {
    int number = 0;
    for (bool failed = true; failed;) {
        const boost::shared_ptr<EndCounter> counter = makeCountedSession();
        {
            const AllocationFault fault(++number, extent);
            session->start();
            failed = AllocationFault::hasHappened();
        }
        if (failed && counter->ends != 0) {
            EXPECT_EQ(counter->code, Talvox::SpeechError::ErrorUnknown) << "allocation " << number;
        }
        expectOneEnd(*counter);
    }
    EXPECT_GT(number, 10);
    expectTheNextSessionIsRight();
}

TEST_F(ScarcityTest, EachAllocationOfStartMayFail) {
    failEachAllocationOfStart(AllocationFault::ONE);
}

TEST_F(ScarcityTest, AllAllocationsOfStartMayFailFromAnyOn) {
    failEachAllocationOfStart(AllocationFault::ALL_FROM_THERE_ON);
}

void ScarcityTest::failAllocationsOfASession(bool streaming, const std::string& format) {
    configure([&](Settings& settings) {
        settings.putBoolean(Settings::SKS_STREAMING, streaming);
        settings.putString(Settings::SKS_SOUND_FORMAT, format);
    });
    const CloudTest::BufferPtr sound = CloudTest::makeConstantBuffer(1000);
    int number = 0;
    for (bool failed = true; failed; number += 1 + number / 20) {
        const boost::shared_ptr<EndCounter> counter = makeCountedSession();
        session->start();
        {
            const AllocationFault fault(number + 1, AllocationFault::ONE);
            for (int buffers = 0; buffers < 15; ++buffers) {
                advanceMs(100);
                recorder->deliver(sound);
            }
            failed = AllocationFault::hasHappened();
        }
        kdDrainEventsKOR();
        const Util::EventLock lock;
        expectOneEnd(*counter);
    }
    expectTheNextSessionIsRight();
}

TEST_F(ScarcityTest, AllocationsOfASimpleSessionMayFail) {
    failAllocationsOfASession(false, Settings::SOUND_FORMAT_PCM);
}

TEST_F(ScarcityTest, AllocationsOfAChunkedSpeexSessionMayFail) {
    failAllocationsOfASession(true, Settings::SOUND_FORMAT_SPEEX);
}

/** The event inside which a listener throws. */
class ThrowingListenerTest : public ScarcityTest,
                             public ::testing::WithParamInterface<const char*> {};

TEST_P(ThrowingListenerTest, EndsTheSessionOnceForEachListener) {
    const std::string event = GetParam();
    const bool isEnd = event == "results";
    const auto witness = boost::make_shared<EventRecorder>();
    makeSession();
    session->addListener(witness);
    events->hook = [&event](const std::string& text, Talvox::Recognizer*) {
        if (text == event) {
            throw std::runtime_error("broken");
        }
    };
    session->start();
    play(2000);
    ASSERT_TRUE(witness->waitForEnds());
    kdDrainEventsKOR();
    EXPECT_EQ(events->countEnds(), 1u);
    EXPECT_EQ(witness->countEnds(), 1u);
    EXPECT_EQ(witness->texts().back(), isEnd ? "results" : "error ErrorUnknown");
    EXPECT_EQ(witness->errorReason(), isEnd ? "" : "broken");
    EXPECT_TRUE(isEngineFree());
    EXPECT_TRUE(log.containsPart("broken"));
    expectTheNextSessionIsRight();
}

INSTANTIATE_TEST_SUITE_P(Events, ThrowingListenerTest,
                         ::testing::Values("recordingBegin", "speakingBegin", "buffer", "power",
                                           "recordingDone", "results"));

TEST_F(ScarcityTest, ListenerThatThrowsInItsErrorLeavesTheOthersTheirs) {
    const auto witness = boost::make_shared<EventRecorder>();
    makeSession();
    session->addListener(witness);
    events->hook = [](const std::string& text, Talvox::Recognizer*) {
        if (text == "error ErrorCanceled") {
            throw 1;
        }
    };
    session->start();
    session->cancel();
    EXPECT_EQ(events->texts(), Texts({"error ErrorCanceled"}));
    EXPECT_EQ(witness->texts(), Texts({"error ErrorCanceled"}));
    EXPECT_TRUE(isEngineFree());
}

TEST_F(ScarcityTest, RecorderThatThrowsAtItsStartIsOneErrorAndIsStopped) {
    prepareRecorder = [](CloudTest::ScriptedRecorder& made) {
        made.insideStart = [] { throw std::runtime_error("no room"); };
    };
    startSession();
    EXPECT_EQ(events->texts(), Texts({"error ErrorUnknown"}));
    EXPECT_EQ(events->errorReason(), "no room");
    EXPECT_EQ(recorder->stops, 1);
    EXPECT_TRUE(isEngineFree());
    prepareRecorder = {};
    expectTheNextSessionIsRight();
}

TEST_F(ScarcityTest, RecorderThatThrowsWhenItIsStoppedIsOneError) {
    startSession();
    recorder->insideStop = [] { throw std::runtime_error("stuck"); };
    session->stop();
    EXPECT_EQ(events->texts(), Texts({"error ErrorUnknown"}));
    EXPECT_EQ(events->errorReason(), "stuck");
    EXPECT_TRUE(isEngineFree());
}

TEST_F(ScarcityTest, ExceptionOfAnotherCallbackEndsTheActiveSession) {
    startSession();
    kdPostKOR([](void*) { throw std::runtime_error("broken elsewhere"); }, nullptr);
    EXPECT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts(), Texts({"error ErrorUnknown"}));
    EXPECT_EQ(events->errorReason(), "broken elsewhere");
    EXPECT_FALSE(recorder->isRecording());
    EXPECT_TRUE(isEngineFree());
    expectTheNextSessionIsRight();
}

TEST_F(ScarcityTest, ExceptionOfAnotherCallbackLeavesASessionThatIsOverAlone) {
    startSession();
    session->cancel();
    kdPostKOR([](void*) { throw std::runtime_error("broken elsewhere"); }, nullptr);
    kdDrainEventsKOR();
    EXPECT_EQ(events->texts(), Texts({"error ErrorCanceled"}));
}

}  // namespace
