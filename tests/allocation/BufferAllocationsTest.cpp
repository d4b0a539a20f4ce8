#include <gtest/gtest.h>

#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "core/util/EventLock.h"
#include "support/AllocationCount.h"
#include "support/StreamedSession.h"
#include "support/TestSound.h"
#include "talvox/Settings.h"

namespace {

using TestSupport::AllocationCounts;
using TestSupport::BUFFER_ALLOCATIONS_MAX;
using TestSupport::countAllocations;

constexpr int SAMPLE_RATE = 16000;
constexpr int SPEECH_MS = 16000;

/** One allocation that no compiler may leave out. */
void allocate() {
    void* volatile memory = std::malloc(16);
    std::free(memory);
}

AllocationCounts since(const AllocationCounts& before) {
    const AllocationCounts now = countAllocations();
    return {now.all - before.all, now.onAudioThread - before.onAudioThread,
            now.underEventLock - before.underEventLock};
}

TEST(AllocationCount, TellsThreadsAndTheEventLockApart) {
    AllocationCounts before = countAllocations();
    allocate();
    AllocationCounts counts = since(before);
    EXPECT_EQ(counts.all, 1u);
    EXPECT_EQ(counts.onAudioThread, 0u);
    EXPECT_EQ(counts.underEventLock, 0u);
    {
        const Util::EventLock lock;
        before = countAllocations();
        allocate();
        counts = since(before);
    }
    EXPECT_EQ(counts.all, 1u);
    EXPECT_EQ(counts.underEventLock, 1u);
    std::thread([&counts] {
        TestSupport::markAudioThread();
        const AllocationCounts start = countAllocations();
        allocate();
        counts = since(start);
    }).join();
    EXPECT_EQ(counts.onAudioThread, 1u);
    EXPECT_EQ(counts.underEventLock, 0u);
}

class BufferAllocations : public ::testing::TestWithParam<std::string> {};

TEST_P(BufferAllocations, StayWithinTheirBounds) {
    const std::vector<int16_t> speech = TestSupport::makeSpeechLike(SAMPLE_RATE, SPEECH_MS);
    const TestSupport::BufferAllocations counts =
        TestSupport::measureBufferAllocations(speech, GetParam());
    EXPECT_LE(counts.all, BUFFER_ALLOCATIONS_MAX.all);
    EXPECT_LE(counts.onAudioThread, BUFFER_ALLOCATIONS_MAX.onAudioThread);
    EXPECT_LE(counts.underEventLock, BUFFER_ALLOCATIONS_MAX.underEventLock);
}

INSTANTIATE_TEST_SUITE_P(SoundFormats, BufferAllocations,
                         ::testing::Values(Talvox::Settings::SOUND_FORMAT_SPEEX,
                                           Talvox::Settings::SOUND_FORMAT_PCM));

}  // namespace
