#include "libs/webrtc_vad.h"

#include <dlfcn.h>
#include <gmock/gmock.h>

#include <algorithm>
#include <cstring>
#include <ostream>
#include <tuple>
#include <vector>

#include "support/BareVad.h"
#include "support/TestSound.h"
#include "vad/VadTestSupport.h"

namespace {

using TestSupport::BareVad;
using TestSupport::Samples;
using Decisions = std::vector<int>;

/** Owns one instance of the detector under test. */
class Vad {
  public:
    explicit Vad(int mode) {
        EXPECT_EQ(0, WebRtcVad_Create(&handle));
        EXPECT_EQ(0, WebRtcVad_Init(handle));
        EXPECT_EQ(0, WebRtcVad_set_mode(handle, static_cast<int16_t>(mode)));
    }
    ~Vad() { WebRtcVad_Free(handle); }
    Vad(const Vad&) = delete;
    Vad& operator=(const Vad&) = delete;

    int process(int rate, const int16_t* samples, std::size_t length) {
        return WebRtcVad_Process(handle, static_cast<int16_t>(rate), samples,
                                 static_cast<int16_t>(length));
    }

    VadInst* handle = nullptr;
};

template <typename Detector>
Decisions decide(Detector& detector, int rate, int frameMs, const Samples& samples) {
    const auto length = static_cast<std::size_t>(rate * frameMs / 1000);
    Decisions decisions;
    for (std::size_t begin = 0; begin + length <= samples.size(); begin += length) {
        decisions.push_back(detector.process(rate, samples.data() + begin, length));
    }
    return decisions;
}

Decisions decideBare(int mode, int rate, int frameMs, const Samples& samples) {
    BareVad bare(mode);
    return decide(bare, rate, frameMs, samples);
}

bool hasBoth(const Decisions& decisions) {
    return std::count(decisions.begin(), decisions.end(), 0) > 0 &&
           std::count(decisions.begin(), decisions.end(), 1) > 0;
}

Samples recordedAt(int rate) {
    Samples samples = TestSupport::loadRecordedSpeech("something.raw");
    const Samples more = TestSupport::loadRecordedSpeech("goforward.raw");
    samples.insert(samples.end(), more.begin(), more.end());
    if (rate == 8000) {
        return TestSupport::halveRate(samples);
    }
    return rate == 32000 ? TestSupport::doubleRate(samples) : samples;
}

/** Every mode at one rate and frame length. */
class GoldenMatrix : public ::testing::TestWithParam<std::tuple<int, int>> {
  protected:
    const int rate = std::get<0>(GetParam());
    const int frameMs = std::get<1>(GetParam());

    void expectAsBare(const Samples& samples) const {
        for (const int mode : {0, 1, 2, 3}) {
            Vad vad(mode);
            const Decisions expected = decideBare(mode, rate, frameMs, samples);
            EXPECT_TRUE(hasBoth(expected)) << "mode " << mode;
            EXPECT_EQ(expected, decide(vad, rate, frameMs, samples)) << "mode " << mode;
        }
    }
};

TEST_P(GoldenMatrix, DecidesAsTheBareDetectorOnSpeechLikeSound) {
    expectAsBare(TestSupport::speechLike(rate, 6000));
}

TEST_P(GoldenMatrix, DecidesAsTheBareDetectorOnNoise) {
    TestSupport::NoiseSource noise(7);
    Samples samples(static_cast<std::size_t>(rate) * 3);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        // A second each of silence, of the loudest noise, and of faint noise.
        const float gain = i < samples.size() / 3       ? 0.0F
                           : i < samples.size() / 3 * 2 ? 32767.0F
                                                        : 20.0F;
        samples[i] = static_cast<int16_t>(gain * noise.next());
    }
    expectAsBare(samples);
}

TEST_P(GoldenMatrix, DecidesAsTheBareDetectorOnRecordedSpeech) {
    const Samples samples = recordedAt(rate);
    if (samples.empty()) {
        GTEST_SKIP() << "recorded speech is not installed: "
                     << TestSupport::recordedSpeechPath("something.raw");
    }
    expectAsBare(samples);
}

INSTANTIATE_TEST_SUITE_P(RatesAndFrames, GoldenMatrix,
                         ::testing::Combine(::testing::Values(8000, 16000, 32000),
                                            ::testing::Values(10, 20, 30)));

/** What mode 3 uses for frames of one length. */
struct StrictParams {
    int frameMs;
    WebRtc_ModeParams params;
};

void PrintTo(const StrictParams& strict, std::ostream* out) {
    *out << strict.frameMs << " ms";
}

class FineGrained : public ::testing::TestWithParam<StrictParams> {};

TEST_P(FineGrained, ValuesOfAModeDecideAsThatMode) {
    const StrictParams& strict = GetParam();
    for (const int rate : {8000, 16000, 32000}) {
        const Samples& samples = TestSupport::speechLike(rate, 6000);
        Vad vad(0);
        ASSERT_EQ(0, WebRtcVad_set_mode_fine_grained(vad.handle, &strict.params));
        const Decisions expected = decideBare(3, rate, strict.frameMs, samples);
        EXPECT_NE(decideBare(0, rate, strict.frameMs, samples), expected);
        EXPECT_EQ(expected, decide(vad, rate, strict.frameMs, samples));
    }
}

TEST_P(FineGrained, ThresholdsBeyondReachSilenceFramesOfThisLength) {
    const WebRtc_ModeParams unreachable = {32767, 32767, 0, 0};
    const Samples& samples = TestSupport::speechLike(16000, 3000);
    Vad vad(0);
    ASSERT_EQ(0, WebRtcVad_set_mode_fine_grained(vad.handle, &unreachable));
    EXPECT_THAT(decide(vad, 16000, GetParam().frameMs, samples), ::testing::Each(0));
}

TEST_P(FineGrained, IsReplacedByTheNextMode) {
    const Samples& samples = TestSupport::speechLike(16000, 3000);
    Vad vad(0);
    ASSERT_EQ(0, WebRtcVad_set_mode_fine_grained(vad.handle, &GetParam().params));
    ASSERT_EQ(0, WebRtcVad_set_mode(vad.handle, 1));
    EXPECT_EQ(decideBare(1, 16000, GetParam().frameMs, samples),
              decide(vad, 16000, GetParam().frameMs, samples));
}

INSTANTIATE_TEST_SUITE_P(FrameLengths, FineGrained,
                         ::testing::Values(StrictParams{10, {94, 1100, 6, 9}},
                                           StrictParams{20, {94, 1050, 3, 5}},
                                           StrictParams{30, {94, 1100, 2, 3}}));

TEST(WebRtcVad, FineGrainedHangOverKeepsSpeechAliveForAsManyFrames) {
    Samples samples = TestSupport::makeSpeechLike(16000, 1400);
    samples.resize(samples.size() + 16000, 0);
    std::vector<std::ptrdiff_t> ends;
    for (const int16_t hangOver : {0, 5, 30}) {
        const WebRtc_ModeParams params = {94, 1100, hangOver, hangOver};
        Vad vad(0);
        ASSERT_EQ(0, WebRtcVad_set_mode_fine_grained(vad.handle, &params));
        const Decisions decisions = decide(vad, 16000, 10, samples);
        const auto last = std::find(decisions.rbegin(), decisions.rend(), 1);
        ASSERT_NE(decisions.rend(), last);
        ends.push_back(decisions.rend() - last);
    }
    EXPECT_EQ(5, ends[1] - ends[0]);
    EXPECT_EQ(30, ends[2] - ends[0]);
}

TEST(WebRtcVad, ForcedNoiseAnswersNoise) {
    Vad vad(0);
    ASSERT_EQ(0, WebRtcVad_force_noise(vad.handle, 1));
    EXPECT_THAT(decide(vad, 16000, 10, TestSupport::speechLike(16000, 2000)), ::testing::Each(0));
}

TEST(WebRtcVad, ForcedNoiseDoesNotDisturbLaterDecisions) {
    const Samples& samples = TestSupport::speechLike(16000, 6000);
    const Decisions expected = decideBare(2, 16000, 10, samples);
    for (const std::size_t forcedFrames : {std::size_t{1}, std::size_t{50}, std::size_t{333}}) {
        const auto boundary = static_cast<std::ptrdiff_t>(forcedFrames * 160);
        Vad vad(2);
        ASSERT_EQ(0, WebRtcVad_force_noise(vad.handle, 1));
        decide(vad, 16000, 10, Samples(samples.begin(), samples.begin() + boundary));
        ASSERT_EQ(0, WebRtcVad_force_noise(vad.handle, 0));
        const Decisions later =
            decide(vad, 16000, 10, Samples(samples.begin() + boundary, samples.end()));
        EXPECT_EQ(
            Decisions(expected.begin() + static_cast<std::ptrdiff_t>(forcedFrames), expected.end()),
            later);
    }
}

TEST(WebRtcVad, ForcedNoiseStillRefusesWhatIsNotSupported) {
    const Samples samples(480, 0);
    Vad vad(0);
    ASSERT_EQ(0, WebRtcVad_force_noise(vad.handle, 1));
    EXPECT_EQ(-1, vad.process(16000, samples.data(), 161));
}

TEST(WebRtcVad, InitForgetsModeForcedNoiseAndWhatWasLearnt) {
    const Samples& samples = TestSupport::speechLike(16000, 4000);
    Vad vad(3);
    WebRtcVad_force_noise(vad.handle, 1);
    decide(vad, 16000, 10, samples);
    ASSERT_EQ(0, WebRtcVad_Init(vad.handle));
    EXPECT_EQ(decideBare(0, 16000, 10, samples), decide(vad, 16000, 10, samples));
}

TEST(WebRtcVad, InstancesAreIndependent) {
    const Samples& samples = TestSupport::speechLike(16000, 2000);
    const Samples other = TestSupport::makeSpeechLike(16000, 2000, 99);
    Vad vad(1);
    Vad neighbour(3);
    Decisions decisions;
    for (std::size_t begin = 0; begin + 160 <= samples.size(); begin += 160) {
        decisions.push_back(vad.process(16000, samples.data() + begin, 160));
        neighbour.process(16000, other.data() + begin, 160);
    }
    EXPECT_EQ(decideBare(1, 16000, 10, samples), decisions);
}

TEST(WebRtcVad, RefusesUnsupportedRatesAndLengths) {
    const Samples samples(2000, 100);
    Vad vad(0);
    for (const int rate : {0, -1, 1, 7999, 11025, 22050, 24000, 32001, 32767, -32768}) {
        for (const std::size_t length : {80U, 110U, 160U, 240U, 320U, 480U, 960U}) {
            EXPECT_EQ(-1, vad.process(rate, samples.data(), length)) << rate << " " << length;
        }
    }
    for (const std::size_t length : {0U, 1U, 79U, 159U, 161U, 640U, 1440U}) {
        EXPECT_EQ(-1, vad.process(16000, samples.data(), length)) << length;
    }
    EXPECT_EQ(-1, WebRtcVad_Process(vad.handle, 16000, samples.data(), -160));
}

TEST(WebRtcVad, RefusesUnknownModesAndKeepsTheOneThatIsSet) {
    const Samples& samples = TestSupport::speechLike(16000, 3000);
    Vad vad(3);
    for (const int16_t mode : {-1, 4, 32767, -32768}) {
        EXPECT_EQ(-1, WebRtcVad_set_mode(vad.handle, mode));
    }
    EXPECT_EQ(decideBare(3, 16000, 10, samples), decide(vad, 16000, 10, samples));
}

TEST(WebRtcVad, RefusesNullArguments) {
    const Samples samples(160, 0);
    const WebRtc_ModeParams params = {1, 2, 3, 4};
    EXPECT_EQ(-1, WebRtcVad_Create(nullptr));
    EXPECT_EQ(0, WebRtcVad_Free(nullptr));
    EXPECT_EQ(-1, WebRtcVad_Init(nullptr));
    EXPECT_EQ(-1, WebRtcVad_set_mode(nullptr, 0));
    EXPECT_EQ(-1, WebRtcVad_Process(nullptr, 16000, samples.data(), 160));
    EXPECT_EQ(-1, WebRtcVad_set_mode_fine_grained(nullptr, &params));
    EXPECT_EQ(-1, WebRtcVad_force_noise(nullptr, 1));
    Vad vad(0);
    EXPECT_EQ(-1, vad.process(16000, nullptr, 160));
    EXPECT_EQ(-1, WebRtcVad_set_mode_fine_grained(vad.handle, nullptr));
}

TEST(WebRtcVad, RefusesWorkBeforeInit) {
    const Samples samples(160, 0);
    VadInst* handle = nullptr;
    ASSERT_EQ(0, WebRtcVad_Create(&handle));
    EXPECT_EQ(-1, WebRtcVad_set_mode(handle, 0));
    EXPECT_EQ(-1, WebRtcVad_Process(handle, 16000, samples.data(), 160));
    WebRtcVad_Free(handle);
}

TEST(WebRtcVad, KeepsTheCoreToItself) {
    EXPECT_NE(nullptr, dlsym(RTLD_DEFAULT, "WebRtcVad_Process"));
    for (const char* name : {"WebRtcVad_InitCore", "WebRtcVad_CalcVad16khz", "WebRtcSpl_Init"}) {
        EXPECT_EQ(nullptr, dlsym(RTLD_DEFAULT, name)) << name;
    }
}

}  // namespace
