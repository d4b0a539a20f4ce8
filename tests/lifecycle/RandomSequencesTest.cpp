#include <gtest/gtest.h>

#include "Runner.h"
#include "Testbed.h"

namespace {

using Talvox::SpeechError;

const std::uint64_t SEQUENCES_PER_PART = 2500;

/** In parts, so that several run at a time. */
class RandomSequencesTest : public ::testing::TestWithParam<int> {};

TEST_P(RandomSequencesTest, KeepTheContract) {
    const auto part = static_cast<std::uint64_t>(GetParam());
    Lifecycle::Testbed testbed;
    const std::string found =
        Lifecycle::run(testbed, {1 + SEQUENCES_PER_PART * part, SEQUENCES_PER_PART});
    EXPECT_TRUE(found.empty()) << found;
    // The sequences reach what they are made for: each way in which a session can end.
    for (const int code :
         {SpeechError::ErrorAudio, SpeechError::ErrorNetwork, SpeechError::ErrorCanceled,
          SpeechError::ErrorNoVoice, SpeechError::ErrorNotAvailable, SpeechError::ErrorBusy,
          SpeechError::ErrorMax}) {
        EXPECT_GT(testbed.getEnds()[static_cast<std::size_t>(code)], 0) << code;
    }
}

INSTANTIATE_TEST_SUITE_P(Seeds, RandomSequencesTest, ::testing::Range(0, 8));

}  // namespace
