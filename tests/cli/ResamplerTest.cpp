#include "cli/Resampler.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <cmath>

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

double rms(const std::vector<int16_t>& samples) {
    double sum = 0;
    for (const int16_t sample : samples) {
        sum += static_cast<double>(sample) * sample;
    }
    return std::sqrt(sum / static_cast<double>(samples.size()));
}

TEST(Resampler, LeavesSoundAtItsOwnRateAlone) {
    const std::vector<int16_t> samples = {0, 1, -1, 32767, -32768};
    EXPECT_EQ(toSamples(clipOf(samples, 16000), 16000), samples);
}

TEST(Resampler, RoundsAndClips) {
    AudioClip clip;
    clip.sampleRateHz = 8000;
    clip.samples = {0.4F, 0.6F, -0.6F, 40000, -40000};
    EXPECT_THAT(toSamples(clip, 8000), ElementsAre(0, 1, -1, 32767, -32768));
}

TEST(Resampler, GivesExactlyTheLengthOfTheSound) {
    for (const int from : {8000, 11025, 16000, 22050, 32000, 44100, 48000, 44101, 96000}) {
        for (const std::size_t length : {1, 2, 159, 160, 12345}) {
            const std::vector<int16_t> samples(length, 100);
            const auto expected =
                static_cast<std::size_t>(std::lround(static_cast<double>(length) * 16000 / from));
            EXPECT_EQ(toSamples(clipOf(samples, from), 16000).size(), expected)
                << length << " samples at " << from << " Hz";
        }
    }
}

TEST(Resampler, KeepsToneLevelAndPosition) {
    for (const int from : {8000, 22050, 44100, 48000}) {
        const std::vector<int16_t> output =
            toSamples(clipOf(TestSupport::sine(from, 0.5, 440, 8000), from), 16000);
        const std::vector<int16_t> expected = TestSupport::sine(16000, 0.5, 440, 8000);
        ASSERT_EQ(output.size(), expected.size());
        std::vector<int16_t> difference;
        // The ends carry the filter's settling.
        for (std::size_t index = 400; index + 400 < output.size(); ++index) {
            difference.push_back(static_cast<int16_t>(output[index] - expected[index]));
        }
        EXPECT_LT(rms(difference), 0.01 * rms(expected)) << from << " Hz";
    }
}

TEST(Resampler, RemovesWhatTheLowerRateCannotCarry) {
    const std::vector<int16_t> output =
        toSamples(clipOf(TestSupport::sine(44100, 0.5, 12000, 8000), 44100), 16000);
    EXPECT_LT(rms(output), 80);
}

TEST(Resampler, RefusesARateOfNothing) {
    EXPECT_THROW(toSamples(clipOf({1, 2, 3}, 8000), 0), Cli::UsageError);
    EXPECT_THROW(toSamples(clipOf({1, 2, 3}, 8000), -16000), Cli::UsageError);
}

}  // namespace
