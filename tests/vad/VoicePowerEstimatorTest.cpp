#include "talvox/impl/VoicePowerEstimator.h"

#include <gmock/gmock.h>

#include <cmath>
#include <limits>
#include <vector>

#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "support/TestSound.h"

namespace {

using Sound::SoundDataBuffer;
using Sound::SoundDataInfo;
using Talvox::VoicePowerEstimator;
using ::testing::ElementsAre;
using TestSupport::makeBuffer;
using TestSupport::makeSquareWave;

SoundDataBuffer makeRawBuffer(int channels, int sampleSize, int count,
                              std::vector<unsigned char> bytes) {
    return {SoundDataInfo(SoundDataInfo::NONE, channels, 16000, sampleSize, count),
            std::move(bytes)};
}

TEST(VoicePowerEstimator, BeginsAtZero) {
    const VoicePowerEstimator estimator;
    EXPECT_EQ(0, estimator.getMode());
    EXPECT_EQ(0, estimator.getNoiseSamples());
    EXPECT_EQ(0.0F, estimator.getNoiseEnergy());
    EXPECT_EQ(0.0F, estimator.getNoiseLevel());
    EXPECT_EQ(0.0F, estimator.getPower());
    EXPECT_EQ(0.0F, estimator.getLevel());
    EXPECT_EQ(0.2F, VoicePowerEstimator::WEIGHT_NEW_ENERGY);
    EXPECT_EQ(45.3087F, VoicePowerEstimator::POWER_MAX);
}

TEST(VoicePowerEstimator, SumsSquaresOfSigned16BitLittleEndianSamples) {
    const VoicePowerEstimator estimator;
    // 1, -1, 256, -32768
    const auto buffer = makeRawBuffer(1, 2, 4, {0x01, 0x00, 0xFF, 0xFF, 0x00, 0x01, 0x00, 0x80});
    EXPECT_EQ(1.0F + 1.0F + 65536.0F + 1073741824.0F, estimator.getEnergy(buffer));
}

TEST(VoicePowerEstimator, SumsSquaresOfSigned8BitSamples) {
    const VoicePowerEstimator estimator;
    EXPECT_EQ(1.0F + 16384.0F + 16129.0F,
              estimator.getEnergy(makeRawBuffer(1, 1, 3, {0xFF, 0x80, 0x7F})));
}

TEST(VoicePowerEstimator, SumsOverAllChannels) {
    const VoicePowerEstimator estimator;
    EXPECT_EQ(4.0F, estimator.getEnergy(makeRawBuffer(2, 1, 2, {1, 1, 1, 1})));
}

TEST(VoicePowerEstimator, ReadsNoMoreSamplesThanClaimed) {
    const VoicePowerEstimator estimator;
    EXPECT_EQ(2.0F, estimator.getEnergy(makeRawBuffer(1, 1, 2, {1, 1, 1, 1})));
}

TEST(VoicePowerEstimator, ReadsNoMoreSamplesThanThereAre) {
    const VoicePowerEstimator estimator;
    EXPECT_EQ(3.0F, estimator.getEnergy(makeRawBuffer(1, 1, 1000000, {1, 1, 1})));
    EXPECT_EQ(1.0F, estimator.getEnergy(makeRawBuffer(1, 2, 1000000, {1, 0, 1})));
    EXPECT_EQ(2.0F, estimator.getEnergy(makeRawBuffer(std::numeric_limits<int>::max(), 1,
                                                      std::numeric_limits<int>::max(), {1, 1})));
}

TEST(VoicePowerEstimator, ABufferWithoutSamplesHasNoEnergy) {
    const VoicePowerEstimator estimator;
    EXPECT_EQ(0.0F, estimator.getEnergy(makeRawBuffer(1, 2, 0, {})));
    EXPECT_EQ(0.0F, estimator.getEnergy(makeRawBuffer(1, 2, 100, {})));
    EXPECT_EQ(0.0F, estimator.getEnergy(makeRawBuffer(-1, 2, 100, {1, 1})));
}

TEST(VoicePowerEstimator, SilenceHasNoLevel) {
    VoicePowerEstimator estimator;
    estimator.learnNoise(makeBuffer(TestSupport::Samples(1600, 0), 16000));
    estimator.updatePower(makeBuffer(TestSupport::Samples(1600, 0), 16000));
    EXPECT_EQ(0.0F, estimator.getNoiseLevel());
    EXPECT_EQ(0.0F, estimator.getPower());
    EXPECT_EQ(0.0F, estimator.getLevel());
    EXPECT_EQ(1600, estimator.getNoiseSamples());
}

TEST(VoicePowerEstimator, LevelFallsToZeroOncePowerHasLeft) {
    VoicePowerEstimator estimator;
    estimator.setMode(1);
    estimator.updatePower(makeBuffer(makeSquareWave(1600, 1000), 16000));
    const float loud = estimator.getLevel();
    for (int i = 0; i < 10; ++i) {
        estimator.updatePower(makeBuffer(TestSupport::Samples(1600, 0), 16000));
    }
    EXPECT_NEAR(loud + 10 * 10 * std::log10(0.8), estimator.getLevel(), 0.001);
}

TEST(VoicePowerEstimator, FullScaleSquareWaveReachesTheTop) {
    VoicePowerEstimator estimator;
    estimator.setMode(1);
    const SoundDataBuffer buffer = makeBuffer(makeSquareWave(1600, 32767), 16000);
    EXPECT_NEAR(1.07e9, estimator.getEnergy(buffer) / 1600, 0.01e9);
    for (int i = 0; i < 100; ++i) {
        estimator.updatePower(buffer);
    }
    EXPECT_NEAR(60.3, estimator.getLevel(), 0.05);
}

TEST(VoicePowerEstimator, SmoothsEnergy) {
    // Short buffers, so that the sums are exact.
    VoicePowerEstimator estimator;
    estimator.setMode(1);
    estimator.updatePower(makeBuffer(makeSquareWave(10, 1000), 16000));
    EXPECT_FLOAT_EQ(200000.0F, estimator.getPower());
    estimator.updatePower(makeBuffer(makeSquareWave(10, 1000), 16000));
    EXPECT_FLOAT_EQ(360000.0F, estimator.getPower());
    estimator.updatePower(makeBuffer(makeSquareWave(10, 0), 16000));
    EXPECT_FLOAT_EQ(288000.0F, estimator.getPower());
    EXPECT_FLOAT_EQ(10 * std::log10(288000.0F) - 30, estimator.getLevel());
}

TEST(VoicePowerEstimator, TwoEqualNoiseBuffersRaiseTheLevelBy3Decibels) {
    VoicePowerEstimator estimator;
    const SoundDataBuffer noise = makeBuffer(makeSquareWave(1600, 500), 16000);
    estimator.learnNoise(noise);
    const float one = estimator.getNoiseLevel();
    EXPECT_NEAR(10 * std::log10(250000.0) - 45, one, 0.001);
    estimator.learnNoise(noise);
    EXPECT_NEAR(3.0103, estimator.getNoiseLevel() - one, 0.001);
    EXPECT_EQ(3200, estimator.getNoiseSamples());
}

TEST(VoicePowerEstimator, NoiseLevelDividesByTheLatestBufferAlone) {
    VoicePowerEstimator estimator;
    estimator.learnNoise(makeBuffer(makeSquareWave(1600, 500), 16000));
    estimator.learnNoise(makeBuffer(makeSquareWave(160, 500), 16000));
    EXPECT_NEAR(10 * std::log10(250000.0 * 1760 / 160) - 45, estimator.getNoiseLevel(), 0.001);
}

TEST(VoicePowerEstimator, ModeDecidesBetweenRelativeAndAbsoluteLevel) {
    VoicePowerEstimator estimator;
    estimator.learnNoise(makeBuffer(makeSquareWave(1600, 500), 16000));
    const SoundDataBuffer loud = makeBuffer(makeSquareWave(1600, 5000), 16000);
    estimator.updatePower(loud);
    const float mean = 0.2F * 25000000.0F;
    EXPECT_NEAR(10 * std::log10(mean) - 45 - estimator.getNoiseLevel(), estimator.getLevel(),
                0.001);
    VoicePowerEstimator absolute;
    absolute.setMode(1);
    absolute.updatePower(loud);
    EXPECT_NEAR(10 * std::log10(mean) - 30, absolute.getLevel(), 0.001);
}

TEST(VoicePowerEstimator, UnknownModeRaisesTheAssertionAndKeepsTheLevel) {
    TestSupport::AssertCapture asserts;
    VoicePowerEstimator estimator;
    estimator.setMode(1);
    const SoundDataBuffer loud = makeBuffer(makeSquareWave(1600, 5000), 16000);
    estimator.updatePower(loud);
    const float level = estimator.getLevel();
    estimator.setMode(2);
    estimator.updatePower(loud);
    EXPECT_EQ(level, estimator.getLevel());
    EXPECT_THAT(asserts.reports(), ElementsAre(TestSupport::AssertReport{
                                       "false", "talvox/impl/VoicePowerEstimator", 81}));
}

TEST(VoicePowerEstimator, UnknownSampleSizeIsLoggedAndHasNoEnergy) {
    TestSupport::LogCapture log;
    VoicePowerEstimator estimator;
    const auto buffer = makeRawBuffer(1, 4, 2, {1, 1, 1, 1, 1, 1, 1, 1});
    EXPECT_EQ(0.0F, estimator.getEnergy(buffer));
    EXPECT_THAT(log.messages(), ElementsAre("getEnergy: unknown sample size 4"));
    estimator.learnNoise(buffer);
    EXPECT_EQ(2, estimator.getNoiseSamples());
    EXPECT_EQ(0.0F, estimator.getNoiseLevel());
    estimator.updatePower(buffer);
    EXPECT_EQ(0.0F, estimator.getLevel());
}

TEST(VoicePowerEstimator, AnEmptyBufferMakesTheLevelNaN) {
    VoicePowerEstimator estimator;
    estimator.updatePower(makeRawBuffer(1, 2, 0, {}));
    EXPECT_TRUE(std::isnan(estimator.getLevel()));
    VoicePowerEstimator afterNoise;
    afterNoise.learnNoise(makeBuffer(makeSquareWave(1600, 500), 16000));
    afterNoise.learnNoise(makeRawBuffer(1, 2, 0, {}));
    EXPECT_TRUE(std::isinf(afterNoise.getNoiseLevel()));
}

TEST(VoicePowerEstimator, CountsOfAbsurdBuffersWrapAround) {
    VoicePowerEstimator estimator;
    for (int i = 0; i < 3; ++i) {
        estimator.learnNoise(makeRawBuffer(2, 2, std::numeric_limits<int>::max(), {}));
    }
    EXPECT_EQ(-6, estimator.getNoiseSamples());
    EXPECT_EQ(0.0F, estimator.getNoiseLevel());
}

}  // namespace
