#include "cli/ClipSamples.h"

#include <gmock/gmock.h>

#include "SoundFiles.h"
#include "cli/UsageError.h"

namespace {

using Cli::AudioClip;
using Cli::toSamples;
using ::testing::ElementsAre;

AudioClip clipOf(const std::vector<int16_t>& samples, int sampleRateHz) {
    AudioClip clip;
    clip.samples.assign(samples.begin(), samples.end());
    clip.sampleRateHz = sampleRateHz;
    return clip;
}

TEST(ClipSamples, LeavesSoundAtItsOwnRateAlone) {
    const std::vector<int16_t> samples = {0, 1, -1, 32767, -32768};
    EXPECT_EQ(toSamples(clipOf(samples, 16000), 16000), samples);
}

TEST(ClipSamples, RoundsAndClips) {
    AudioClip clip;
    clip.sampleRateHz = 8000;
    clip.samples = {0.4F, 0.6F, -0.6F, 40000, -40000};
    EXPECT_THAT(toSamples(clip, 8000), ElementsAre(0, 1, -1, 32767, -32768));
}

TEST(ClipSamples, BringsTheClipToTheWantedRate) {
    const std::vector<int16_t> output =
        toSamples(clipOf(TestSupport::sine(44100, 0.5), 44100), 16000);
    const std::vector<int16_t> expected = TestSupport::sine(16000, 0.5);
    ASSERT_EQ(output.size(), expected.size());
    // The ends carry the filter's settling.
    for (std::size_t index = 400; index + 400 < output.size(); ++index) {
        ASSERT_NEAR(output[index], expected[index], 100) << index;
    }
}

TEST(ClipSamples, RefusesARateOfNothing) {
    EXPECT_THROW(toSamples(clipOf({1, 2, 3}, 8000), 0), Cli::UsageError);
    EXPECT_THROW(toSamples(clipOf({1, 2, 3}, 8000), -16000), Cli::UsageError);
}

}  // namespace
