#include "core/sound/FileRecorder.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <climits>
#include <functional>
#include <future>
#include <vector>

#include "core/util/EventLock.h"
#include "pal/kd_event.h"
#include "pal/kd_time.h"
#include "support/TestSound.h"

namespace {

using Sound::FileRecorder;
using Sound::Recorder;
using Sound::SoundDataBuffer;
using TestSupport::Samples;

const KDint64 NS_PER_MS = 1000000;

class Collector : public Sound::RecorderListener {
  public:
    void onRecorderDataReceived(Recorder* recorder,
                                boost::shared_ptr<const SoundDataBuffer> buffer) override {
        EXPECT_EQ(kdHoldsEventLockKOR(), 1);
        buffers.push_back(buffer);
        if (reaction) {
            reaction(recorder);
        }
    }
    void onRecorderError(Recorder* /*recorder*/) override { ++errors; }

    std::vector<boost::shared_ptr<const SoundDataBuffer>> buffers;
    int errors = 0;
    std::function<void(Recorder*)> reaction;
};

class FileRecorderTest : public ::testing::Test {
  protected:
    FileRecorderTest() { kdUseManualClockKOR(0); }
    ~FileRecorderTest() override {
        recorder.reset();
        kdUseRealClockKOR();
    }

    /** A recorder whose buffers arrive with their last sample, unless a delay is given. */
    void make(const Samples& samples, int deviceDelayMs = 0) {
        add(boost::make_shared<FileRecorder>(samples, deviceDelayMs));
    }

    void add(const boost::shared_ptr<FileRecorder>& made) {
        recorder = made;
        recorder->addListener(listener);
    }

    boost::shared_ptr<Collector> listener = boost::make_shared<Collector>();
    boost::shared_ptr<FileRecorder> recorder;
};

TEST_F(FileRecorderTest, DeliversTheSoundThenSilenceInBuffersOfTheAskedLength) {
    const Samples sound = TestSupport::makeSquareWave(2000, 12345);
    make(sound);
    ASSERT_TRUE(recorder->init());
    recorder->startRecording();
    EXPECT_TRUE(recorder->isRecording());
    kdAdvanceClockKOR(400 * NS_PER_MS);
    ASSERT_EQ(listener->buffers.size(), 4U);
    Samples expected = sound;
    expected.resize(6400, 0);
    for (std::size_t i = 0; i < 4; ++i) {
        const SoundDataBuffer& buffer = *listener->buffers[i];
        EXPECT_EQ(buffer.getData(), TestSupport::toBytes(expected, i * 1600, 1600)) << i;
        EXPECT_EQ(buffer.getInfo().getCodec(), Sound::SoundDataInfo::NONE);
        EXPECT_EQ(buffer.getInfo().getChannelCount(), 1);
        EXPECT_EQ(buffer.getInfo().getSampleRate(), 16000);
        EXPECT_EQ(buffer.getInfo().getSampleSize(), 2);
        EXPECT_EQ(buffer.getInfo().getSampleCount(), 1600);
    }
    EXPECT_EQ(listener->errors, 0);
}

TEST_F(FileRecorderTest, IsPacedByThePlatformClock) {
    make(Samples());
    recorder->setBufferLength(20);
    ASSERT_TRUE(recorder->init());
    kdAdvanceClockKOR(100 * NS_PER_MS);
    EXPECT_TRUE(listener->buffers.empty());
    recorder->startRecording();
    kdAdvanceClockKOR(20 * NS_PER_MS - 1);
    EXPECT_TRUE(listener->buffers.empty());
    kdAdvanceClockKOR(1);
    EXPECT_EQ(listener->buffers.size(), 1U);
    kdAdvanceClockKOR(1000 * NS_PER_MS);
    EXPECT_EQ(listener->buffers.size(), 51U);
}

TEST_F(FileRecorderTest, BuffersArriveTheDelayAfterTheirLastSample) {
    make(Samples(), 7);
    ASSERT_TRUE(recorder->init());
    recorder->startRecording();
    for (std::size_t i = 1; i <= 3; ++i) {
        kdAdvanceClockKOR((i == 1 ? 107 : 100) * NS_PER_MS - 1);
        EXPECT_EQ(listener->buffers.size(), i - 1);
        kdAdvanceClockKOR(1);
        EXPECT_EQ(listener->buffers.size(), i);
    }
}

TEST_F(FileRecorderTest, TheDelayIs20MsUnlessAskedForOtherwise) {
    add(boost::make_shared<FileRecorder>(Samples()));
    ASSERT_TRUE(recorder->init());
    recorder->startRecording();
    kdAdvanceClockKOR(120 * NS_PER_MS - 1);
    EXPECT_TRUE(listener->buffers.empty());
    kdAdvanceClockKOR(1);
    EXPECT_EQ(listener->buffers.size(), 1U);
}

TEST_F(FileRecorderTest, ADelayBelowZeroIsNone) {
    for (const int delay : {-1, INT_MIN}) {
        make(Samples(), delay);
        ASSERT_TRUE(recorder->init());
        recorder->startRecording();
        kdAdvanceClockKOR(100 * NS_PER_MS);
        EXPECT_EQ(listener->buffers.size(), 1U) << delay;
        listener->buffers.clear();
    }
}

TEST_F(FileRecorderTest, PlaysAtTheRateWhereABufferHasNoWholeNumberOfSamples) {
    make(Samples(), 20);
    recorder->setSampleRate(11025);
    ASSERT_TRUE(recorder->init());
    recorder->startRecording();
    // 1102 samples a buffer, so the second one ends 199.909 ms after the beginning.
    const KDint64 secondEndNs = KDint64{2204} * 1000000000 / 11025;
    kdAdvanceClockKOR(secondEndNs + 20 * NS_PER_MS - 1);
    EXPECT_EQ(listener->buffers.size(), 1U);
    kdAdvanceClockKOR(1);
    EXPECT_EQ(listener->buffers.size(), 2U);
    // Ten minutes later no time is lost.
    kdAdvanceClockKOR(600 * KDint64{1000000000} - secondEndNs - 20 * NS_PER_MS);
    EXPECT_EQ(listener->buffers.size(), 600U * 11025U / 1102U);
}

TEST_F(FileRecorderTest, NoBufferArrivesWhileTheStarterHoldsTheEventLock) {
    // On the real clock, since moving the other one by hand fires timers at once.
    kdUseRealClockKOR();
    make(Samples(), 20);
    recorder->setBufferLength(10);
    std::promise<KDint64> secondArrived;
    listener->reaction = [this, &secondArrived](Recorder* notified) {
        if (listener->buffers.size() == 2) {
            secondArrived.set_value(kdGetTimeUST());
            notified->stopRecording();
        }
    };
    KDint64 startTime = 0;
    {
        const Util::EventLock lock;
        ASSERT_TRUE(recorder->init());
        const KDint64 begun = kdGetTimeUST();
        recorder->startRecording();
        // A start that takes longer than delay and buffers together.
        while (kdGetTimeUST() < begun + 80 * NS_PER_MS) {
        }
        startTime = kdGetTimeUST();
        EXPECT_TRUE(listener->buffers.empty());
    }
    EXPECT_GE(secondArrived.get_future().get() - startTime, 40 * NS_PER_MS);
    const Util::EventLock untilTheListenerReturns;
}

TEST_F(FileRecorderTest, ExtremeSamplesKeepTheirValues) {
    make({INT16_MIN, -1, 0, 1, INT16_MAX});
    recorder->setSampleRate(1000);
    recorder->setBufferLength(5);
    ASSERT_TRUE(recorder->init());
    recorder->startRecording();
    kdAdvanceClockKOR(5 * NS_PER_MS);
    ASSERT_EQ(listener->buffers.size(), 1U);
    EXPECT_EQ(listener->buffers[0]->getData(),
              (std::vector<unsigned char>{0x00, 0x80, 0xFF, 0xFF, 0, 0, 1, 0, 0xFF, 0x7F}));
}

TEST_F(FileRecorderTest, StopEndsTheBuffersAndStartGoesOnWhereItWas) {
    const Samples sound = TestSupport::makeSquareWave(3200, 7);
    make(sound);
    ASSERT_TRUE(recorder->init());
    recorder->startRecording();
    kdAdvanceClockKOR(150 * NS_PER_MS);
    recorder->stopRecording();
    EXPECT_FALSE(recorder->isRecording());
    kdAdvanceClockKOR(1000 * NS_PER_MS);
    EXPECT_EQ(listener->buffers.size(), 1U);
    recorder->startRecording();
    kdAdvanceClockKOR(100 * NS_PER_MS);
    ASSERT_EQ(listener->buffers.size(), 2U);
    EXPECT_EQ(listener->buffers[1]->getData(), TestSupport::toBytes(sound, 1600, 1600));
}

TEST_F(FileRecorderTest, ListenerMayStopAndDropTheRecorder) {
    make(Samples(160000, 1));
    listener->reaction = [this](Recorder* notified) {
        notified->stopRecording();
        recorder.reset();
    };
    ASSERT_TRUE(recorder->init());
    recorder->startRecording();
    kdAdvanceClockKOR(1000 * NS_PER_MS);
    EXPECT_EQ(listener->buffers.size(), 1U);
    EXPECT_FALSE(recorder);
}

TEST_F(FileRecorderTest, NothingComesAfterItsDestruction) {
    make(Samples(1600, 1));
    ASSERT_TRUE(recorder->init());
    recorder->startRecording();
    recorder.reset();
    kdAdvanceClockKOR(1000 * NS_PER_MS);
    EXPECT_TRUE(listener->buffers.empty());
}

TEST_F(FileRecorderTest, AbsurdFormatIsRefusedAndHarmless) {
    for (const int rate : {INT_MIN, -1, 0, 999, 384001, INT_MAX}) {
        make(Samples(100, 1));
        recorder->setSampleRate(rate);
        EXPECT_FALSE(recorder->init()) << rate;
        recorder->startRecording();
        kdAdvanceClockKOR(1000 * NS_PER_MS);
    }
    for (const int length : {INT_MIN, -1, 0, 10001, INT_MAX}) {
        make(Samples(100, 1));
        recorder->setBufferLength(length);
        EXPECT_FALSE(recorder->init()) << length;
        recorder->startRecording();
        kdAdvanceClockKOR(1000 * NS_PER_MS);
    }
    EXPECT_TRUE(listener->buffers.empty());
}

TEST_F(FileRecorderTest, RateChangedToAnAbsurdOneWhileRecordingIsHarmless) {
    make(Samples(100, 1));
    ASSERT_TRUE(recorder->init());
    recorder->startRecording();
    kdAdvanceClockKOR(50 * NS_PER_MS);
    recorder->setSampleRate(-5);
    kdAdvanceClockKOR(1000 * NS_PER_MS);
    EXPECT_TRUE(listener->buffers.empty());
}

}  // namespace
