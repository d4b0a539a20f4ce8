// Sessions for which the system lacks threads or memory, and sessions that are interrupted by an
// exception: one end, nothing left behind, and the next session is right.
#include <dlfcn.h>
#include <gmock/gmock.h>

#include <atomic>
#include <boost/make_shared.hpp>
#include <memory>
#include <new>
#include <stdexcept>
#include <string>

#include "SessionTest.h"
#include "core/sound/OggSpeexEncoder.h"
#include "core/util/EventLock.h"
#include "core/util/Singleton.h"
#include "pal/kd.h"
#include "support/AllocationFault.h"
#include "support/EndCounter.h"
#include "support/LogCapture.h"
#include "talvox/impl/ParallelEncoder.h"

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
using TestSupport::EndCounter;

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

TEST_F(ScarcityTest, EachAllocationOfACreationMayFail) {
    int standIns = 0;
    int number = 0;
    for (bool failed = true; failed;) {
        const auto counter = boost::make_shared<EndCounter>();
        const auto settings = boost::make_shared<Settings>();
        {
            const AllocationFault fault(++number, AllocationFault::ONE);
            session = engine().createRecognizer(counter, settings);
            failed = AllocationFault::hasHappened();
        }
        ASSERT_NE(session, nullptr) << "allocation " << number;
        if (failed && log.containsPart("no recognizer can be made")) {
            ++standIns;
            log.clear();
            const AllocationFault fault(1, AllocationFault::ALL_FROM_THERE_ON);
            session->start();
            EXPECT_EQ(counter->code, Talvox::SpeechError::ErrorUnknown) << "allocation " << number;
        }
        expectOneEnd(*counter);
    }
    EXPECT_GT(standIns, 10);
    expectTheNextSessionIsRight();
}

/** The stand-in that `createRecognizer` returns where there is no memory at all. */
class StandInTest : public ScarcityTest {
  protected:
    boost::shared_ptr<Talvox::Recognizer> create(const boost::shared_ptr<EventRecorder>& hearer) {
        const AllocationFault fault(1, AllocationFault::ALL_FROM_THERE_ON);
        return engine().createRecognizer(hearer, ownSettings);
    }

    const boost::shared_ptr<EventRecorder> listener = boost::make_shared<EventRecorder>();
    const boost::shared_ptr<const Settings> ownSettings = boost::make_shared<const Settings>();
};

TEST_F(StandInTest, ReportsOneErrorAndItsReason) {
    const boost::shared_ptr<Talvox::Recognizer> standIn = create(listener);
    standIn->stop();
    EXPECT_EQ(listener->texts(), Texts());
    standIn->start();
    standIn->start();
    standIn->cancel();
    EXPECT_EQ(listener->texts(), Texts({"error ErrorUnknown"}));
    EXPECT_EQ(listener->errorReason(), "no memory for a recognizer");
    EXPECT_TRUE(isEngineFree());
}

TEST_F(StandInTest, CanBeCancelledInstead) {
    const boost::shared_ptr<Talvox::Recognizer> standIn = create(listener);
    standIn->cancel();
    standIn->start();
    EXPECT_EQ(listener->texts(), Texts({"error ErrorCanceled"}));
}

TEST_F(StandInTest, ServesTheNextCallerOnceItIsReleased) {
    boost::shared_ptr<Talvox::Recognizer> standIn = create(listener);
    standIn->addListener(listener);
    standIn->start();
    EXPECT_EQ(create(listener), nullptr);
    standIn.reset();
    const auto next = boost::make_shared<EventRecorder>();
    standIn = create(next);
    ASSERT_NE(standIn, nullptr);
    EXPECT_EQ(standIn->getErrorReason(), "");
    standIn->start();
    EXPECT_EQ(next->texts(), Texts({"error ErrorUnknown"}));
    EXPECT_EQ(listener->countEnds(), 2u);  // of the first session: added twice
}

/** Has results when it is started. */
class ReadyRecognizer : public Talvox::Recognizer {
  public:
    explicit ReadyRecognizer(const Talvox::Talvox& facade)
        : Recognizer(&facade, boost::make_shared<const Settings>()) {
        hypotheses->emplace_back("go", 0.9F);
    }
    void start() override { callOnResults(hypotheses, requestId); }
    void stop() override {}
    void cancel() override {}

  private:
    boost::shared_ptr<Talvox::RecognitionResults> hypotheses =
        boost::make_shared<Talvox::RecognitionResults>();
    const std::string requestId = "an identifier of some length";
};

TEST_F(ScarcityTest, ResultsWithoutMemoryToJudgeThemAreOneError) {
    for (const auto extent : {AllocationFault::ONE, AllocationFault::ALL_FROM_THERE_ON}) {
        int number = 0;
        for (bool failed = true; failed;) {
            const auto counter = boost::make_shared<EndCounter>();
            const auto recognizer = boost::make_shared<ReadyRecognizer>(engine());
            recognizer->addListener(counter);
            {
                const AllocationFault fault(++number, extent);
                recognizer->start();
                failed = AllocationFault::hasHappened();
            }
            EXPECT_EQ(counter->ends, 1) << "allocation " << number;
            EXPECT_EQ(counter->code, failed ? Talvox::SpeechError::ErrorUnknown : -1)
                << "allocation " << number;
        }
        EXPECT_GT(number, 2);
    }
}

TEST_F(ScarcityTest, AListenerThatIsGoneTakesNoMemoryAtTheEnd) {
    const boost::shared_ptr<EndCounter> counter = makeCountedSession();
    session->addListener(boost::make_shared<EndCounter>());
    {
        const AllocationFault fault(1, AllocationFault::ALL_FROM_THERE_ON);
        session->cancel();
    }
    EXPECT_EQ(counter->ends, 1);
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

TEST_F(ScarcityTest, EachAllocationOfAnEncoderMayFail) {
    const CloudTest::BufferPtr sound = CloudTest::makeConstantBuffer(1000);
    int number = 0;
    for (bool failed = true; failed;) {
        Sound::OggSpeexEncoder encoder(sound->getInfo(), 8);
        bool threw = false;
        {
            const AllocationFault fault(++number, AllocationFault::ONE);
            try {
                encoder.encode(*sound);
            } catch (const std::bad_alloc&) {
                threw = true;
            }
            failed = AllocationFault::hasHappened();
        }
        EXPECT_EQ(failed, threw || encoder.hasFailed()) << "allocation " << number;
    }
    EXPECT_GT(number, 3);
}

TEST_F(ScarcityTest, AnEncoderWithoutMemoryForItsFirstTaskCanBeDestroyed) {
    const CloudTest::BufferPtr sound = CloudTest::makeConstantBuffer(1000);
    int number = 0;
    for (bool failed = true; failed;) {
        Util::SingletonStorage::destroyAll();  // the task manager, too
        auto encoder = std::make_unique<Talvox::ParallelEncoder>(
            boost::make_shared<Sound::OggSpeexEncoder>(sound->getInfo(), 8),
            [](const boost::shared_ptr<const Sound::SoundDataBuffer>&) {});
        const Util::EventLock lock;
        const AllocationFault fault(++number, AllocationFault::ALL_FROM_THERE_ON);
        try {
            encoder->write(sound);
        } catch (const std::bad_alloc&) {
            EXPECT_TRUE(AllocationFault::hasHappened());
        }
        encoder.reset();
        failed = AllocationFault::hasHappened();
    }
    EXPECT_GT(number, 3);
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
