#include "tools/Resampler.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <stdexcept>

#include "support/TestSound.h"

namespace {

using TestSupport::Samples;
using Tools::Resampler;

constexpr unsigned RATE = 16000;

Samples sine(double hertz, unsigned rateHz, std::size_t count) {
    Samples samples(count);
    for (std::size_t i = 0; i < count; ++i) {
        samples[i] = static_cast<int16_t>(
            10000 * std::sin(2 * 3.14159265358979 * hertz * static_cast<double>(i) / rateHz));
    }
    return samples;
}

Samples resample(const Samples& input, unsigned from, unsigned to, std::size_t piece) {
    Resampler resampler(from, to);
    Samples output;
    for (std::size_t i = 0; i < input.size(); i += piece) {
        resampler.write(&input[i], std::min(piece, input.size() - i), output);
    }
    resampler.finish(output);
    return output;
}

double rms(const Samples& samples) {
    double sum = 0;
    for (const int16_t sample : samples) {
        sum += static_cast<double>(sample) * sample;
    }
    return std::sqrt(sum / static_cast<double>(samples.size()));
}

}  // namespace

TEST(Resampler, LeavesSoundOfTheRightRateAlone) {
    const Samples input = {0, 1, -1, 32767, -32768};
    EXPECT_EQ(input, resample(input, RATE, RATE, 2));
}

TEST(Resampler, GivesExactlyTheLengthOfTheSound) {
    for (const unsigned from :
         {8000U, 11025U, 16000U, 22050U, 32000U, 44100U, 48000U, 44101U, 96000U}) {
        for (const std::size_t length : {1U, 2U, 159U, 160U, 12345U}) {
            const auto expected =
                static_cast<std::size_t>(std::lround(static_cast<double>(length) * RATE / from));
            EXPECT_EQ(expected, resample(Samples(length, 100), from, RATE, 1000).size())
                << length << " samples at " << from << " Hz";
        }
    }
}

TEST(Resampler, KeepsPitchLevelAndPlace) {
    for (const unsigned rate : {8000U, 11025U, 22050U, 44100U, 48000U}) {
        const Samples output = resample(sine(440, rate, rate), rate, RATE, 1000);
        const Samples expected = sine(440, RATE, RATE);
        ASSERT_EQ(expected.size(), output.size());
        Samples difference;
        // The ends carry the filter's settling.
        for (std::size_t i = 200; i + 200 < output.size(); ++i) {
            ASSERT_NEAR(expected[i], output[i], 150) << rate << " Hz, sample " << i;
            if (i >= 400 && i + 400 < output.size()) {
                difference.push_back(static_cast<int16_t>(output[i] - expected[i]));
            }
        }
        EXPECT_LT(rms(difference), 0.01 * rms(expected)) << rate << " Hz";
    }
}

TEST(Resampler, DoesNotFoldHighPitchesDown) {
    const Samples output = resample(sine(12000, 44100, 44100), 44100, RATE, 1000);
    EXPECT_LT(rms(output), 80);
    for (std::size_t i = 200; i + 200 < output.size(); ++i) {
        ASSERT_NEAR(0, output[i], 100);
    }
}

TEST(Resampler, GivesTheSameFromPiecesOfAnySize) {
    const Samples input = TestSupport::makeSpeechLike(11025, 500);
    const Samples whole = resample(input, 11025, RATE, input.size());
    for (const std::size_t piece : {1U, 7U, 160U, 1025U}) {
        EXPECT_EQ(whole, resample(input, 11025, RATE, piece)) << piece;
    }
}

TEST(Resampler, GivesNothingForNothing) {
    EXPECT_TRUE(resample({}, 8000, RATE, 1).empty());
}

TEST(Resampler, RefusesARateOfNothing) {
    EXPECT_THROW(Resampler(0, RATE), std::invalid_argument);
    EXPECT_THROW(Resampler(RATE, 0), std::invalid_argument);
    EXPECT_THROW(Resampler(0, 0), std::invalid_argument);
}
