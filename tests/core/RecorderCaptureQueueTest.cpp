#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <boost/make_shared.hpp>
#include <condition_variable>
#include <cstddef>
#include <mutex>
#include <thread>
#include <vector>

#include "core/sound/CaptureQueue.h"
#include "core/sound/RecorderFormat.h"
#include "core/sound/ZeroWatch.h"

namespace {

using Sound::CaptureQueue;
using Sound::RecorderFormat;
using Sound::SoundDataBuffer;
using Bytes = std::vector<unsigned char>;

/** 16 kHz, 10 ms: 160 samples, 320 bytes. */
const RecorderFormat FORMAT(16000, 10);

Bytes makeBytes(std::size_t count) {
    Bytes bytes(count);
    for (std::size_t i = 0; i < count; ++i) {
        bytes[i] = static_cast<unsigned char>(i * 7 % 251 + 1);
    }
    return bytes;
}

class RecorderCaptureQueue : public ::testing::Test {
  protected:
    int wakes = 0;
    CaptureQueue queue{FORMAT, [this] { ++wakes; }};
};

TEST_F(RecorderCaptureQueue, CutsPiecesOfAnyLengthIntoBuffersOfTheAskedOne) {
    const Bytes sound = makeBytes(320 * 7 + 100);
    for (std::size_t step : {2U, 322U, 640U, 1000U}) {
        Bytes received;
        std::size_t begin = 0;
        CaptureQueue own(FORMAT, [] {});
        while (begin < sound.size()) {
            const std::size_t size = std::min(step, sound.size() - begin);
            ASSERT_TRUE(own.push(sound.data() + begin, size));
            begin += size;
        }
        for (const auto& buffer : own.take().buffers) {
            EXPECT_EQ(buffer->getData().size(), 320U);
            EXPECT_EQ(buffer->getInfo().getCodec(), Sound::SoundDataInfo::NONE);
            EXPECT_EQ(buffer->getInfo().getChannelCount(), 1);
            EXPECT_EQ(buffer->getInfo().getSampleRate(), 16000);
            EXPECT_EQ(buffer->getInfo().getSampleSize(), 2);
            EXPECT_EQ(buffer->getInfo().getSampleCount(), 160);
            received.insert(received.end(), buffer->getData().begin(), buffer->getData().end());
        }
        EXPECT_EQ(received, Bytes(sound.begin(), sound.end() - 100)) << step;
    }
}

TEST_F(RecorderCaptureQueue, HoleBecomesSilenceOfItsLength) {
    const Bytes sound = makeBytes(200);
    queue.push(sound.data(), 200);
    queue.push(nullptr, 220);
    queue.push(sound.data(), 200);
    queue.push(nullptr, 20);
    const CaptureQueue::Batch batch = queue.take();
    ASSERT_EQ(batch.buffers.size(), 2U);
    Bytes expected = sound;
    expected.resize(420, 0);
    expected.insert(expected.end(), sound.begin(), sound.end());
    expected.resize(640, 0);
    Bytes received = batch.buffers[0]->getData();
    received.insert(received.end(), batch.buffers[1]->getData().begin(),
                    batch.buffers[1]->getData().end());
    EXPECT_EQ(received, expected);
}

TEST_F(RecorderCaptureQueue, WakesOncePerTake) {
    const Bytes sound = makeBytes(320);
    queue.push(sound.data(), 300);
    EXPECT_EQ(wakes, 0);
    queue.push(sound.data(), 20);
    queue.push(sound.data(), 320);
    EXPECT_EQ(wakes, 1);
    EXPECT_EQ(queue.take().buffers.size(), 2U);
    queue.push(sound.data(), 320);
    EXPECT_EQ(wakes, 2);
}

TEST_F(RecorderCaptureQueue, FullQueueFailsBehindTheSoundThatWaits) {
    const Bytes sound = makeBytes(CaptureQueue::BUFFERS_MAX * 320);
    const Bytes more(320, 255);
    ASSERT_TRUE(queue.push(sound.data(), sound.size()));
    EXPECT_FALSE(queue.push(more.data(), more.size()));
    EXPECT_FALSE(queue.push(more.data(), 2));
    const CaptureQueue::Batch batch = queue.take();
    ASSERT_EQ(batch.buffers.size(), CaptureQueue::BUFFERS_MAX);
    Bytes received;
    for (const auto& buffer : batch.buffers) {
        received.insert(received.end(), buffer->getData().begin(), buffer->getData().end());
    }
    EXPECT_EQ(received, sound);
    EXPECT_TRUE(batch.failed);
    EXPECT_EQ(batch.reason, "recorded sound was not taken in time");
    EXPECT_FALSE(queue.push(more.data(), more.size()));
    EXPECT_FALSE(queue.take().failed);
}

TEST_F(RecorderCaptureQueue, QueueThatIsTakenInTimeNeverFills) {
    const Bytes sound = makeBytes(320);
    for (std::size_t i = 0; i < 3 * CaptureQueue::BUFFERS_MAX; ++i) {
        ASSERT_TRUE(queue.push(sound.data(), sound.size()));
        EXPECT_EQ(queue.take().buffers.size(), 1U);
    }
}

TEST_F(RecorderCaptureQueue, BuffersStayAsTheyAreWhileSomebodyHoldsThem) {
    const Bytes sound = makeBytes(std::size_t{320} * 251);
    std::vector<boost::shared_ptr<const SoundDataBuffer>> held;
    Bytes received;
    for (std::size_t i = 0; i < 251; ++i) {
        ASSERT_TRUE(queue.push(sound.data() + i * 320, 320));
        held.push_back(queue.take().buffers.at(0));
    }
    for (const auto& buffer : held) {
        received.insert(received.end(), buffer->getData().begin(), buffer->getData().end());
    }
    EXPECT_EQ(received, sound);
}

TEST_F(RecorderCaptureQueue, SoundPassesWholeBetweenTwoThreads) {
    const Bytes sound = makeBytes(std::size_t{320} * 2000);
    std::mutex mutex;
    std::condition_variable woken;
    bool isAwake = false;
    CaptureQueue own(FORMAT, [&] {
        const std::lock_guard<std::mutex> lock(mutex);
        isAwake = true;
        woken.notify_one();
    });
    std::atomic<std::size_t> receivedCount{0};
    std::thread device([&] {
        constexpr std::size_t PIECE = 500;
        for (std::size_t begin = 0; begin < sound.size(); begin += PIECE) {
            // Never more than fit.
            while (begin > receivedCount + 320 * (CaptureQueue::BUFFERS_MAX - 2)) {
                std::this_thread::yield();
            }
            own.push(sound.data() + begin, std::min(PIECE, sound.size() - begin));
        }
    });
    Bytes received;
    while (received.size() < sound.size()) {
        {
            std::unique_lock<std::mutex> lock(mutex);
            woken.wait(lock, [&] { return isAwake; });
            isAwake = false;
        }
        for (const auto& buffer : own.take().buffers) {
            received.insert(received.end(), buffer->getData().begin(), buffer->getData().end());
        }
        receivedCount = received.size();
    }
    device.join();
    EXPECT_EQ(received, sound);
}

TEST_F(RecorderCaptureQueue, FirstFailureCountsAndEndsTheSound) {
    const Bytes sound = makeBytes(320);
    queue.push(sound.data(), 320);
    queue.fail("one");
    queue.fail("two");
    EXPECT_FALSE(queue.push(sound.data(), 320));
    const CaptureQueue::Batch batch = queue.take();
    EXPECT_EQ(batch.buffers.size(), 1U);
    EXPECT_TRUE(batch.failed);
    EXPECT_EQ(batch.reason, "one");
}

TEST_F(RecorderCaptureQueue, FailureStaysBehindSoundThatComesWhileSomeIsTaken) {
    constexpr std::size_t COUNT = 40;
    const Bytes sound = makeBytes(COUNT * 320);
    for (int round = 0; round < 300; ++round) {
        CaptureQueue own(FORMAT, [] {});
        std::thread device([&] {
            own.push(sound.data(), sound.size());
            own.fail("gone");
        });
        std::size_t count = 0;
        bool failed = false;
        while (!failed) {
            const CaptureQueue::Batch& batch = own.take();
            count += batch.buffers.size();
            failed = batch.failed;
        }
        device.join();
        ASSERT_EQ(count, COUNT) << round;
    }
}

TEST_F(RecorderCaptureQueue, EveryPieceCountsAsAnArrival) {
    const unsigned before = queue.getArrivalCount();
    queue.push(nullptr, 2);
    EXPECT_NE(queue.getArrivalCount(), before);
}

TEST(RecorderFormat, RefusesWhatNoDeviceDelivers) {
    for (const int rate : {-16000, -1, 0, 999, 384001, 2147483647}) {
        EXPECT_FALSE(RecorderFormat(rate, 100).isUsable()) << rate;
    }
    for (const int length : {-100, -1, 0, 10001, 2147483647}) {
        EXPECT_FALSE(RecorderFormat(16000, length).isUsable()) << length;
    }
    EXPECT_TRUE(RecorderFormat(1000, 1).isUsable());
    EXPECT_TRUE(RecorderFormat(384000, 10000).isUsable());
}

TEST(RecorderFormat, RoundsTheBufferDownToWholeSamples) {
    EXPECT_EQ(RecorderFormat(11025, 100).getSampleCount(), 1102);
    EXPECT_EQ(RecorderFormat(11025, 100).getByteCount(), 2204U);
    EXPECT_EQ(RecorderFormat(384000, 10000).getSampleCount(), 3840000);
    EXPECT_EQ(RecorderFormat(1000, 1).getSampleCount(), 1);
}

TEST(RecorderFormat, TellsHowLongSamplesLast) {
    EXPECT_EQ(RecorderFormat(16000, 100).getDurationNs(1600), 100000000);
    EXPECT_EQ(RecorderFormat(11025, 100).getDurationNs(2204), 199909297);
    EXPECT_EQ(RecorderFormat(11025, 100).getDurationNs(0), 0);
    // A year and a sample.
    EXPECT_EQ(RecorderFormat(44100, 100).getDurationNs(31536000LL * 44100 + 1), 31536000000022675);
}

SoundDataBuffer makeBuffer(int sampleCount, unsigned char lastByte) {
    Bytes bytes(static_cast<std::size_t>(sampleCount) * 2, 0);
    bytes.back() = lastByte;
    return {Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 1, 16000, 2, sampleCount),
            std::move(bytes)};
}

TEST(RecorderZeroWatch, ReportsOnceWhenThereIsNothingButZerosForOverASecond) {
    Sound::ZeroWatch watch;
    for (int i = 0; i < 10; ++i) {
        EXPECT_FALSE(watch.isSuspicious(makeBuffer(1600, 0)));
    }
    EXPECT_TRUE(watch.isSuspicious(makeBuffer(1600, 0)));
    for (int i = 0; i < 30; ++i) {
        EXPECT_FALSE(watch.isSuspicious(makeBuffer(1600, 0)));
    }
}

TEST(RecorderZeroWatch, OneOtherByteBeginsTheSecondAnew) {
    Sound::ZeroWatch watch;
    for (int i = 0; i < 30; ++i) {
        EXPECT_FALSE(watch.isSuspicious(makeBuffer(1600, i % 10 == 9 ? 1 : 0)));
    }
}

}  // namespace
