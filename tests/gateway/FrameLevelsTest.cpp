#include "gateway/FrameLevels.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>

namespace {

using Gateway::FrameLevels;
using Samples = std::vector<int16_t>;

/** Noise of this amplitude, whose level is 4.8 dB below that of its peaks. */
Samples noise(int milliseconds, int amplitude) {
    std::mt19937 random(1);
    Samples samples;
    for (int i = 0; i < milliseconds * 16; ++i) {
        samples.push_back(static_cast<int16_t>(
            static_cast<int>(random() % static_cast<unsigned>(2 * amplitude + 1)) - amplitude));
    }
    return samples;
}

Samples operator+(Samples first, const Samples& second) {
    first.insert(first.end(), second.begin(), second.end());
    return first;
}

std::size_t countSpeech(const FrameLevels& levels) {
    const double least = levels.findSpeechLevel();
    std::size_t count = 0;
    for (std::size_t i = 0; least >= 0 && i < levels.getCount(); ++i) {
        count += levels.getLevel(i) >= least ? 1U : 0U;
    }
    return count;
}

std::size_t countSpeech(const Samples& samples) {
    FrameLevels levels;
    levels.add(samples.data(), samples.size());
    return countSpeech(levels);
}

}  // namespace

TEST(FrameLevels, MeasuresFramesOfTwentyMillisecondsEachTen) {
    FrameLevels levels;
    const Samples steps = Samples(160, 100) + Samples(160, -100) + Samples(160, 0) +
                          Samples(160, 0) + Samples(159, 7);
    levels.add(steps.data(), steps.size());
    ASSERT_EQ(3U, levels.getCount());
    EXPECT_NEAR(40.0, levels.getLevel(0), 0.001);
    EXPECT_NEAR(37.0, levels.getLevel(1), 0.02);
    EXPECT_EQ(0.0, levels.getLevel(2));
}

TEST(FrameLevels, DoNotDependOnThePieces) {
    const Samples samples = noise(300, 20) + noise(500, 3000);
    FrameLevels whole;
    whole.add(samples.data(), samples.size());
    FrameLevels cut;
    for (std::size_t i = 0; i < samples.size(); i += 77) {
        cut.add(&samples[i], std::min<std::size_t>(77, samples.size() - i));
    }
    ASSERT_EQ(whole.getCount(), cut.getCount());
    for (std::size_t i = 0; i < whole.getCount(); ++i) {
        EXPECT_EQ(whole.getLevel(i), cut.getLevel(i));
    }
}

TEST(FrameLevels, TakeNoNoiseForSpeech) {
    for (const int amplitude : {1, 30, 3000}) {
        EXPECT_EQ(0U, countSpeech(noise(5000, amplitude))) << amplitude;
    }
    EXPECT_EQ(0U, countSpeech(Samples(80000, 0)));
    EXPECT_EQ(0U, countSpeech(Samples(8000, 0) + noise(1200, 30)));
    EXPECT_EQ(0U, countSpeech(noise(1000, 300) + noise(1000, 900)));
    EXPECT_EQ(0U, countSpeech(Samples()));
}

TEST(FrameLevels, FindSpeechAfterAnyWait) {
    for (const int amplitude : {0, 1, 30, 300}) {
        const std::size_t found =
            countSpeech(noise(1200, amplitude) + noise(800, 6000) + noise(500, amplitude));
        EXPECT_GE(found, 78U) << amplitude;
        EXPECT_LE(found, 82U) << amplitude;
    }
}

TEST(FrameLevels, CountQuietSoundsOfSpeech) {
    const Samples speech = noise(300, 6000) + noise(300, 800) + noise(300, 6000);
    const std::size_t found = countSpeech(noise(500, 30) + speech);
    EXPECT_GE(found, 89U);
    EXPECT_LE(found, 91U);
}

TEST(FrameLevels, DoNotTakeAClickForThePeak) {
    const Samples click(800, 30000);
    EXPECT_EQ(0U, countSpeech(noise(1000, 30) + click + noise(1000, 30)));
    const Samples quietSpeech = noise(1000, 500);
    const std::size_t found = countSpeech(noise(1000, 30) + click + noise(500, 30) + quietSpeech);
    EXPECT_GE(found, 99U);
    EXPECT_LE(found, 109U);
}
