#include "talvox/impl/VoiceActivityDetectorWebRTC.h"

#include <gmock/gmock.h>

#include <string>
#include <utility>
#include <vector>

#include "support/AssertCapture.h"
#include "support/BareVad.h"
#include "support/LogCapture.h"
#include "vad/VadTestSupport.h"

namespace {

using Talvox::VoiceActivityDetectorWebRTC;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::AssertCapture;
using TestSupport::AssertReport;
using TestSupport::LogCapture;
using TestSupport::monoFormat;
using TestSupport::Samples;
using TestSupport::speechLike;

constexpr char PATH[] = "talvox/impl/VoiceActivityDetectorWebRTC";
constexpr WebRtc_ModeParams UNSET = {0, 0, 0, 0};

/** Decisions of the detector for all whole frames of the sound. */
std::vector<bool> decide(VoiceActivityDetectorWebRTC& vad, const Samples& samples) {
    const std::size_t size = vad.getFrameSizeInBytes();
    const std::vector<unsigned char> bytes = TestSupport::toBytes(samples, 0, samples.size());
    std::vector<bool> decisions;
    for (std::size_t offset = 0; offset + size <= bytes.size(); offset += size) {
        decisions.push_back(vad.processFrame(bytes.data() + offset));
    }
    return decisions;
}

std::vector<bool> decideBare(int mode, int rate, int frameMs, const Samples& samples) {
    TestSupport::BareVad bare(mode);
    const auto length = static_cast<std::size_t>(rate * frameMs / 1000);
    std::vector<bool> decisions;
    for (std::size_t begin = 0; begin + length <= samples.size(); begin += length) {
        decisions.push_back(bare.process(rate, samples.data() + begin, length) == 1);
    }
    return decisions;
}

/** What the library decides in mode 2 with the given parameters, at 16 kHz in frames of 10 ms. */
std::vector<bool> decideFineGrained(const WebRtc_ModeParams& params, const Samples& samples) {
    VadInst* handle = nullptr;
    WebRtcVad_Create(&handle);
    WebRtcVad_Init(handle);
    WebRtcVad_set_mode(handle, 2);
    if (!(params == UNSET)) {
        WebRtcVad_set_mode_fine_grained(handle, &params);
    }
    std::vector<bool> decisions;
    for (std::size_t begin = 0; begin + 160 <= samples.size(); begin += 160) {
        decisions.push_back(WebRtcVad_Process(handle, 16000, samples.data() + begin, 160) == 1);
    }
    WebRtcVad_Free(handle);
    return decisions;
}

std::vector<bool> decideAfterNoise(VoiceActivityDetectorWebRTC& vad, const Samples& samples,
                                   const std::vector<int16_t>& noiseAmplitudes) {
    vad.setSoundDataInfo(monoFormat(16000));
    vad.start();
    for (const int16_t amplitude : noiseAmplitudes) {
        vad.processNoise(
            TestSupport::makeBuffer(TestSupport::makeSquareWave(1600, amplitude), 16000));
    }
    return decide(vad, samples);
}

std::vector<bool> decideAfterNoise(const Samples& samples,
                                   const std::vector<int16_t>& noiseAmplitudes) {
    VoiceActivityDetectorWebRTC vad;
    return decideAfterNoise(vad, samples, noiseAmplitudes);
}

/** Sound on which the rows of the noise table differ: speech that fades away, over noise. */
Samples fadingSpeech() {
    Samples samples = speechLike(16000, 12000);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const float gain = 1.0F - static_cast<float>(i) / static_cast<float>(samples.size());
        samples[i] = static_cast<int16_t>(static_cast<float>(samples[i]) * gain);
    }
    return samples;
}

TEST(VoiceActivityDetectorWebRTC, HasDefaults) {
    EXPECT_EQ(2, VoiceActivityDetectorWebRTC::AGGRESSIVENESS_DFLT);
    EXPECT_EQ(10, VoiceActivityDetectorWebRTC::FRAME_MS_DFLT);
    EXPECT_EQ(200, VoiceActivityDetectorWebRTC::LEADING_NOISE_MS_DFLT);
    VoiceActivityDetectorWebRTC vad;
    EXPECT_EQ(200, vad.getLeadingNoiseMS());
    EXPECT_FALSE(vad.isSpeech());
    vad.setSoundDataInfo(monoFormat(16000));
    EXPECT_EQ(320U, vad.getFrameSizeInBytes());
    EXPECT_EQ(320U, vad.getFrameStepInBytes());
}

TEST(VoiceActivityDetectorWebRTC, ModeParamsAreEqualInAllFourFields) {
    const WebRtc_ModeParams params = {1, 2, 3, 4};
    EXPECT_TRUE((params == WebRtc_ModeParams{1, 2, 3, 4}));
    EXPECT_FALSE((params == WebRtc_ModeParams{0, 2, 3, 4}));
    EXPECT_FALSE((params == WebRtc_ModeParams{1, 0, 3, 4}));
    EXPECT_FALSE((params == WebRtc_ModeParams{1, 2, 0, 4}));
    EXPECT_FALSE((params == WebRtc_ModeParams{1, 2, 3, 0}));
}

TEST(VoiceActivityDetectorWebRTC, FrameSizeFollowsFormatAndLength) {
    LogCapture log;
    VoiceActivityDetectorWebRTC vad;
    vad.setParameter("framems", "30");
    vad.setSoundDataInfo(Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 2, 8000, 2));
    EXPECT_EQ(960U, vad.getFrameSizeInBytes());
    vad.setSoundDataInfo(Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 1, 11025, 1));
    EXPECT_EQ(330U, vad.getFrameSizeInBytes());
}

TEST(VoiceActivityDetectorWebRTC, FrameLengthThatIsNoNumberMakesEveryFrameEmpty) {
    LogCapture log;
    VoiceActivityDetectorWebRTC vad;
    vad.setSoundDataInfo(monoFormat(16000));
    vad.setParameter("framems", "abc");
    EXPECT_THAT(log.messages(), ElementsAre("frameMS 0"));
    EXPECT_EQ(0U, vad.getFrameSizeInBytes());
}

TEST(VoiceActivityDetectorWebRTC, LogsEachParameterThatItStores) {
    LogCapture log;
    VoiceActivityDetectorWebRTC vad;
    vad.setParameter("engine", "anything");
    vad.setParameter("aggressiveness", "3");
    vad.setParameter("framems", " 20x");
    vad.setParameter("verboselog", "-1");
    vad.setParameter("individual", "98");
    vad.setParameter("total", "1200");
    vad.setParameter("overhangmax1", "5");
    vad.setParameter("overhangmax2", "8");
    vad.setParameter("subengine", "wrtc");
    vad.setParameter("Total", "1");
    vad.setParameter("", "");
    EXPECT_THAT(log.messages(),
                ElementsAre("aggressiveness 3", "frameMS 20", "verboseLevel -1", "individual 98",
                            "total 1200", "over_hang_max_1 5", "over_hang_max_2 8",
                            "Unknown WebRTC VAD parameter setting: subengine",
                            "Unknown WebRTC VAD parameter setting: Total",
                            "Unknown WebRTC VAD parameter setting: "));
}

TEST(VoiceActivityDetectorWebRTC, ModeParamsAreStoredAsTheirLow16Bits) {
    LogCapture log;
    VoiceActivityDetectorWebRTC vad;
    vad.setParameter("total", "65736");
    EXPECT_THAT(log.messages(), ElementsAre("total 200"));
    const Samples samples = fadingSpeech();
    const std::vector<bool> expected = decideFineGrained({0, 200, 0, 0}, samples);
    EXPECT_NE(decideFineGrained(UNSET, samples), expected);
    EXPECT_EQ(expected, decideAfterNoise(vad, samples, {}));
}

TEST(VoiceActivityDetectorWebRTC, DecidesAsTheBareDetectorInEachMode) {
    LogCapture log;
    for (const int rate : {8000, 16000, 32000}) {
        for (const int frameMs : {10, 20, 30}) {
            for (const int mode : {0, 1, 2, 3}) {
                VoiceActivityDetectorWebRTC vad;
                vad.setSoundDataInfo(monoFormat(rate));
                vad.setParameter("aggressiveness", std::to_string(mode));
                vad.setParameter("framems", std::to_string(frameMs));
                vad.start();
                const Samples& samples = speechLike(rate, 3000);
                EXPECT_EQ(decideBare(mode, rate, frameMs, samples), decide(vad, samples));
            }
        }
    }
}

TEST(VoiceActivityDetectorWebRTC, AForcedNoiseStartLastsUntilTheFirstFrame) {
    for (const auto mode :
         {Sound::Recorder::MODE_GENERAL, Sound::Recorder::MODE_VOICE_RECOGNITION}) {
        VoiceActivityDetectorWebRTC vad;
        vad.setSoundDataInfo(monoFormat(16000));
        vad.setSessionMode(mode);
        vad.start();
        EXPECT_EQ(decideBare(2, 16000, 10, speechLike(16000, 3000)),
                  decide(vad, speechLike(16000, 3000)));
    }
}

TEST(VoiceActivityDetectorWebRTC, LeadingNoiseSelectsTheRow) {
    const Samples samples = fadingSpeech();
    const auto none = decideFineGrained(UNSET, samples);
    const auto row7 = decideFineGrained({95, 1100, 6, 9}, samples);
    const auto row9 = decideFineGrained({97, 1150, 6, 9}, samples);
    const auto row12 = decideFineGrained({98, 1200, 5, 8}, samples);
    ASSERT_NE(none, row7);
    ASSERT_NE(row7, row9);
    ASSERT_NE(row9, row12);
    // 10 log10(amplitude squared) - 45: 6.91, 6.998, 7.02, 8.997, 9.01, 11.99, 12.0007 and 45 dB
    EXPECT_EQ(none, decideAfterNoise(samples, {394}));
    EXPECT_EQ(none, decideAfterNoise(samples, {398}));
    EXPECT_EQ(row7, decideAfterNoise(samples, {399}));
    EXPECT_EQ(row7, decideAfterNoise(samples, {501}));
    EXPECT_EQ(row9, decideAfterNoise(samples, {502}));
    EXPECT_EQ(row9, decideAfterNoise(samples, {707}));
    EXPECT_EQ(row12, decideAfterNoise(samples, {708}));
    EXPECT_EQ(row12, decideAfterNoise(samples, {32767}));
}

TEST(VoiceActivityDetectorWebRTC, EachNoiseBufferMaySwitchTheRowAgain) {
    const Samples samples = fadingSpeech();
    // Two equal buffers count 3 dB more than one: 7.02, then 10.03.
    EXPECT_EQ(decideFineGrained({97, 1150, 6, 9}, samples), decideAfterNoise(samples, {399, 399}));
}

TEST(VoiceActivityDetectorWebRTC, ExplicitParamsWinOverTheRow) {
    LogCapture log;
    const Samples samples = fadingSpeech();
    const auto expected = decideFineGrained({0, 1000, 0, 0}, samples);
    ASSERT_NE(decideFineGrained({98, 1200, 5, 8}, samples), expected);
    VoiceActivityDetectorWebRTC vad;
    vad.setParameter("total", "1000");
    EXPECT_EQ(expected, decideAfterNoise(vad, samples, {5000}));
}

TEST(VoiceActivityDetectorWebRTC, FourZeroesCountAsUnset) {
    LogCapture log;
    const Samples samples = fadingSpeech();
    VoiceActivityDetectorWebRTC vad;
    for (const char* name : {"individual", "total", "overhangmax1", "overhangmax2"}) {
        vad.setParameter(name, "0");
    }
    EXPECT_EQ(decideFineGrained({98, 1200, 5, 8}, samples), decideAfterNoise(vad, samples, {708}));
}

TEST(VoiceActivityDetectorWebRTC, RefusedFramesCountAsSpeech) {
    LogCapture log;
    const std::vector<unsigned char> silence(100000, 0);
    for (const auto& [rate, frameMs] : std::vector<std::pair<int, int>>{
             {11025, 10}, {44100, 10}, {48000, 10}, {16000, 15}, {16000, 40}, {8000, 100}}) {
        VoiceActivityDetectorWebRTC vad;
        vad.setSoundDataInfo(monoFormat(rate));
        vad.setParameter("framems", std::to_string(frameMs));
        vad.start();
        EXPECT_TRUE(vad.processFrame(silence.data())) << rate << " " << frameMs;
    }
}

TEST(VoiceActivityDetectorWebRTC, FrameLengthAndFormatTakeEffectAtOnce) {
    LogCapture log;
    VoiceActivityDetectorWebRTC vad;
    vad.setSoundDataInfo(monoFormat(16000));
    vad.start();
    const std::vector<unsigned char> silence(2000, 0);
    EXPECT_FALSE(vad.processFrame(silence.data()));
    vad.setParameter("framems", "15");
    EXPECT_TRUE(vad.processFrame(silence.data()));
    vad.setParameter("framems", "20");
    EXPECT_FALSE(vad.processFrame(silence.data()));
    vad.setSoundDataInfo(monoFormat(11025));
    EXPECT_TRUE(vad.processFrame(silence.data()));
}

TEST(VoiceActivityDetectorWebRTC, StereoRaisesTheChannelAssertion) {
    AssertCapture asserts;
    VoiceActivityDetectorWebRTC vad;
    vad.setSoundDataInfo(Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 2, 16000, 2));
    vad.start();
    const std::vector<unsigned char> frame(vad.getFrameSizeInBytes(), 0);
    EXPECT_FALSE(vad.processFrame(frame.data()));
    EXPECT_THAT(asserts.reports(),
                ElementsAre(AssertReport{"info.getChannelCount() == 1", PATH, 147}));
}

TEST(VoiceActivityDetectorWebRTC, EightBitSoundRaisesTheSampleSizeAssertion) {
    AssertCapture asserts;
    VoiceActivityDetectorWebRTC vad;
    vad.setSoundDataInfo(Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 1, 16000, 1));
    vad.start();
    // Half as many bytes as the library would read; they are not read, and count as speech.
    const std::vector<unsigned char> frame(vad.getFrameSizeInBytes(), 0);
    ASSERT_EQ(160U, frame.size());
    EXPECT_TRUE(vad.processFrame(frame.data()));
    EXPECT_THAT(asserts.reports(),
                ElementsAre(AssertReport{"info.getSampleSize() == 2", PATH, 148}));
}

TEST(VoiceActivityDetectorWebRTC, AFrameBeforeStartRaisesTheAssertion) {
    AssertCapture asserts;
    VoiceActivityDetectorWebRTC vad;
    vad.setSoundDataInfo(monoFormat(16000));
    const std::vector<unsigned char> frame(320, 0);
    EXPECT_TRUE(vad.processFrame(frame.data()));
    EXPECT_THAT(asserts.reports(), ElementsAre(AssertReport{"isStarted", PATH, 146}));
}

TEST(VoiceActivityDetectorWebRTC, StartingTwiceRaisesTheAssertionAndBeginsAnew) {
    AssertCapture asserts;
    VoiceActivityDetectorWebRTC vad;
    vad.setSoundDataInfo(monoFormat(16000));
    vad.start();
    decide(vad, speechLike(16000, 3000));
    vad.start();
    EXPECT_THAT(asserts.reports(), ElementsAre(AssertReport{"!isStarted", PATH, 78}));
    EXPECT_EQ(decideBare(2, 16000, 10, speechLike(16000, 3000)),
              decide(vad, speechLike(16000, 3000)));
}

TEST(VoiceActivityDetectorWebRTC, AThrowingHandlerLeavesTheStartedDetectorAsItWas) {
    AssertCapture asserts(AssertCapture::THROW);
    VoiceActivityDetectorWebRTC vad;
    vad.setSoundDataInfo(monoFormat(16000));
    vad.start();
    EXPECT_THROW(vad.start(), TestSupport::AssertionRaised);
    EXPECT_EQ(decideBare(2, 16000, 10, speechLike(16000, 3000)),
              decide(vad, speechLike(16000, 3000)));
}

TEST(VoiceActivityDetectorWebRTC, StoppingWhatIsStoppedRaisesTheAssertion) {
    AssertCapture asserts;
    VoiceActivityDetectorWebRTC vad;
    vad.stop();
    EXPECT_THAT(asserts.reports(), ElementsAre(AssertReport{"isStarted", PATH, 169}));
}

TEST(VoiceActivityDetectorWebRTC, CancelStopsAndMayBeRepeated) {
    AssertCapture asserts;
    VoiceActivityDetectorWebRTC vad;
    vad.cancel();
    vad.setSoundDataInfo(monoFormat(16000));
    vad.start();
    vad.cancel();
    vad.cancel();
    vad.start();
    EXPECT_EQ(decideBare(2, 16000, 10, speechLike(16000, 3000)),
              decide(vad, speechLike(16000, 3000)));
    vad.stop();
    EXPECT_THAT(asserts.reports(), IsEmpty());
}

TEST(VoiceActivityDetectorWebRTC, NoiseBeforeStartIsHarmless) {
    VoiceActivityDetectorWebRTC vad;
    vad.setSoundDataInfo(monoFormat(16000));
    vad.processNoise(TestSupport::makeBuffer(TestSupport::makeSquareWave(1600, 5000), 16000));
    vad.start();
    EXPECT_EQ(decideBare(2, 16000, 10, speechLike(16000, 3000)),
              decide(vad, speechLike(16000, 3000)));
}

}  // namespace
