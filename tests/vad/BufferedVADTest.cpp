#include "talvox/impl/BufferedVAD.h"

#include <gmock/gmock.h>

#include <boost/make_shared.hpp>
#include <cmath>
#include <limits>
#include <string>
#include <vector>

#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "vad/VadTestSupport.h"

namespace {

using Talvox::BufferedVAD;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::LogCapture;
using TestSupport::makeMarkedBuffer;
using TestSupport::monoFormat;
using TestSupport::ScriptedFrameVAD;

/** A started detector over scripted decisions, at 16 kHz with frames of 10 ms. */
class BufferedVADTest : public ::testing::Test {
  protected:
    void start(const std::vector<std::pair<std::string, std::string>>& parameters = {}) {
        for (const auto& [name, value] : parameters) {
            vad.setParameter(name, value);
        }
        vad.setSoundDataInfo(monoFormat(16000));
        vad.start();
        log.clear();
    }

    /** A buffer of `speechFrames` frames of speech, then silence up to 100 ms. */
    void process(int speechFrames) {
        std::vector<int> frames(10, 0);
        for (int i = 0; i < speechFrames; ++i) {
            frames[static_cast<std::size_t>(i)] = 1;
        }
        vad.process(makeMarkedBuffer(frames));
    }

    void switchOn() {
        process(10);
        process(10);
        process(1);
        ASSERT_TRUE(vad.isSpeech());
        log.clear();
    }

    std::string history() const { return vad.getHistory().toString(vad.getHistory().size()); }

    LogCapture log;
    boost::shared_ptr<ScriptedFrameVAD> frameVad = boost::make_shared<ScriptedFrameVAD>();
    BufferedVAD vad{frameVad};
};

TEST_F(BufferedVADTest, HasDefaults) {
    EXPECT_EQ(400U, BufferedVAD::ANALYZE_MS_ON_DFLT);
    EXPECT_EQ(1000U, BufferedVAD::ANALYZE_MS_OFF_DFLT);
    EXPECT_EQ(0.5F, BufferedVAD::ACTIVITY_ON_DFLT);
    EXPECT_EQ(0.25F, BufferedVAD::ACTIVITY_OFF_DFLT);
    EXPECT_EQ(500U, BufferedVAD::MIN_VOICE_TIME_MS_DFLT);
    EXPECT_FALSE(vad.isSpeech());
    EXPECT_EQ(0U, vad.getHistory().size());
    start();
    EXPECT_EQ(std::string(100, '0'), history());
}

TEST_F(BufferedVADTest, ForwardsToTheFrameDetector) {
    EXPECT_EQ(123, vad.getLeadingNoiseMS());
    vad.setSoundDataInfo(monoFormat(16000));
    vad.setSessionMode(Sound::Recorder::MODE_VOICE_RECOGNITION);
    vad.start();
    vad.processNoise(makeMarkedBuffer({0, 0}));
    vad.setParameter("framems", "20");
    vad.setParameter("", "x");
    vad.cancel();
    EXPECT_THAT(frameVad->calls, ElementsAre("setSoundDataInfo 16000", "setSessionMode 1", "start",
                                             "processNoise 640", "framems=20", "=x", "cancel"));
}

TEST_F(BufferedVADTest, SwitchesOnAboveHalfOfTheLast40Frames) {
    start();
    process(10);
    process(10);
    EXPECT_FALSE(vad.isSpeech());
    EXPECT_EQ(0.5F, vad.getActivity(false));
    process(1);
    EXPECT_TRUE(vad.isSpeech());
    EXPECT_EQ(21.0F / 40.0F, vad.getActivity(false));
}

TEST_F(BufferedVADTest, DoesNotSwitchOnByFramesBeforeTheSpan) {
    start();
    process(10);
    process(10);
    process(0);
    process(0);
    process(1);
    EXPECT_FALSE(vad.isSpeech());
    EXPECT_EQ(11.0F / 40.0F, vad.getActivity(false));
}

TEST_F(BufferedVADTest, SwitchesOffBelowAQuarterOfTheLast100Frames) {
    start();
    switchOn();
    process(4);
    // 25 speech frames; they leave the history 100 frames later at the earliest.
    for (int i = 0; i < 6; ++i) {
        process(0);
        ASSERT_TRUE(vad.isSpeech()) << i;
    }
    EXPECT_EQ(0.25F, vad.getActivity(true));
    process(0);
    EXPECT_FALSE(vad.isSpeech());
    EXPECT_EQ(0.15F, vad.getActivity(true));
}

TEST_F(BufferedVADTest, StaysOnFor500MsWhateverTheFramesSay) {
    start({{"analyzems", "100"}});
    switchOn();
    for (int i = 0; i < 5; ++i) {
        process(0);
        ASSERT_TRUE(vad.isSpeech()) << i;
    }
    process(0);
    EXPECT_FALSE(vad.isSpeech());
}

TEST_F(BufferedVADTest, TheBufferThatSwitchesOnAddsNoTime) {
    start({{"verboselog", "1"}});
    process(10);
    process(10);
    process(1);
    ASSERT_TRUE(vad.isSpeech());
    log.clear();
    process(0);
    EXPECT_THAT(log.messages(), ElementsAre("speechOn; msSinceSpeechStart 100 minVoiceTimeMs 500"));
}

TEST_F(BufferedVADTest, SwitchingOnAgainCountsTimeAnew) {
    start({{"analyzems", "100"}, {"verboselog", "1"}});
    switchOn();
    for (int i = 0; i < 6; ++i) {
        process(0);
    }
    ASSERT_FALSE(vad.isSpeech());
    process(10);
    process(10);
    process(1);
    ASSERT_TRUE(vad.isSpeech());
    log.clear();
    process(0);
    EXPECT_THAT(log.messages(), ElementsAre("speechOn; msSinceSpeechStart 100 minVoiceTimeMs 500"));
}

TEST_F(BufferedVADTest, ABufferShorterThanAFrameOnlyAddsItsDuration) {
    start({{"verboselog", "1"}});
    switchOn();
    const std::string before = history();
    vad.process(makeMarkedBuffer({}, 128));
    EXPECT_THAT(log.messages(), ElementsAre("speechOn; msSinceSpeechStart 4 minVoiceTimeMs 500"));
    EXPECT_EQ(before, history());
}

TEST_F(BufferedVADTest, TheFrameThatEndsAtTheBuffersEndCounts) {
    start();
    vad.process(makeMarkedBuffer({7}));
    EXPECT_THAT(frameVad->firstBytes, ElementsAre(7));
    vad.process(makeMarkedBuffer({8, 9}, 319));
    EXPECT_THAT(frameVad->firstBytes, ElementsAre(7, 8, 9));
    EXPECT_EQ(std::string(97, '0') + "111", history());
}

TEST_F(BufferedVADTest, ABufferAsLongAsTheHistoryReplacesIt) {
    start({{"analyzemson", "30"}, {"analyzemsoff", "30"}});
    vad.process(makeMarkedBuffer({1, 2, 3}));
    EXPECT_THAT(frameVad->firstBytes, ElementsAre(1, 2, 3));
    EXPECT_EQ("111", history());
}

TEST_F(BufferedVADTest, ABufferLongerThanTheHistoryLeavesOutItsLastFrame) {
    start({{"analyzemson", "30"}, {"analyzemsoff", "30"}});
    vad.process(makeMarkedBuffer({1, 2, 3, 4, 5}));
    EXPECT_THAT(frameVad->firstBytes, ElementsAre(2, 3, 4));
}

TEST_F(BufferedVADTest, FramesOfALongBufferAreCountedFromItsEnd) {
    start({{"analyzemson", "20"}, {"analyzemsoff", "20"}});
    std::vector<unsigned char> bytes(4 * 320 + 7, 0);
    bytes[7 + 320] = 21;
    bytes[7 + 2 * 320] = 22;
    bytes[7 + 3 * 320] = 23;
    vad.process({monoFormat(16000), bytes});
    EXPECT_THAT(frameVad->firstBytes, ElementsAre(21, 22));
}

TEST_F(BufferedVADTest, OverlappingFramesAdvanceByTheStep) {
    frameVad->size = 640;
    start();
    vad.process(makeMarkedBuffer({1, 2, 3, 4}));
    EXPECT_THAT(frameVad->firstBytes, ElementsAre(1, 2, 3));
}

TEST_F(BufferedVADTest, TheGeneralSpanChangesTheOffSpanOnly) {
    start({{"analyzems", "800"}});
    EXPECT_EQ(80U, vad.getHistory().size());
    process(10);
    EXPECT_EQ(10.0F / 40.0F, vad.getActivity(false));
    EXPECT_EQ(10.0F / 80.0F, vad.getActivity(true));
}

TEST_F(BufferedVADTest, SpansAreWholeFrames) {
    frameVad->size = frameVad->step = 960;
    start({{"analyzemson", "299"}, {"analyzemsoff", "100"}});
    EXPECT_EQ(9U, vad.getHistory().size());
}

TEST_F(BufferedVADTest, StartingAgainKeepsTheHistoryAndTheState) {
    start();
    switchOn();
    const std::string before = history();
    start({{"analyzems", "1200"}});
    EXPECT_EQ(before + std::string(20, '0'), history());
    EXPECT_TRUE(vad.isSpeech());
    start({{"analyzems", "900"}});
    EXPECT_EQ(before.substr(0, 90), history());
}

TEST_F(BufferedVADTest, LogsEachParameterThatItStores) {
    vad.setParameter("analyzems", "800");
    vad.setParameter("analyzemsoff", "700");
    vad.setParameter("analyzemson", "300");
    vad.setParameter("activityon", "0.75");
    vad.setParameter("activityoff", "x");
    vad.setParameter("minvoicetimems", "-1");
    vad.setParameter("verboselog", "2");
    EXPECT_THAT(log.messages(), ElementsAre("analyzeMS 800", "analyzeMSoff 700", "analyzeMsOn",
                                            "activityOn 0.750000", "activityOff 0.000000",
                                            "minVoiceTimeMS -1", "verboseLevel 2"));
    EXPECT_THAT(frameVad->calls, IsEmpty());
}

TEST_F(BufferedVADTest, AcceptsItsOwnEngineNameSilently) {
    TestSupport::AssertCapture asserts;
    vad.setParameter("engine", "buffered");
    vad.setParameter("subengine", "anything");
    EXPECT_THAT(asserts.reports(), IsEmpty());
    EXPECT_THAT(log.messages(), IsEmpty());
    EXPECT_THAT(frameVad->calls, IsEmpty());
}

TEST_F(BufferedVADTest, AnotherEngineNameRaisesTheAssertion) {
    TestSupport::AssertCapture asserts;
    vad.setParameter("engine", "wrtc");
    EXPECT_THAT(asserts.reports(), ElementsAre(TestSupport::AssertReport{
                                       "aValue == \"buffered\"", "talvox/impl/BufferedVAD", 174}));
    EXPECT_THAT(frameVad->calls, IsEmpty());
}

TEST_F(BufferedVADTest, VerboseLevel1LogsEachDecision) {
    start({{"verboselog", "1"}});
    process(5);
    EXPECT_THAT(log.messages(),
                ElementsAre("speech off; nFramesOn 40; activity: 0.125000; activityOn 0.500000"));
    process(10);
    process(10);
    ASSERT_TRUE(vad.isSpeech());
    for (int i = 0; i < 5; ++i) {
        process(0);
    }
    log.clear();
    process(0);
    EXPECT_THAT(log.messages(),
                ElementsAre("speech on; nFramesOff 100; activity: 0.250000; activityOff 0.250000"));
}

TEST_F(BufferedVADTest, VerboseLevel2AlsoLogsTheHistory) {
    start({{"analyzemson", "40"}, {"analyzemsoff", "80"}, {"verboselog", "2"}});
    vad.process(makeMarkedBuffer({1, 0}));
    EXPECT_THAT(log.messages(),
                ElementsAre("0.125000: 00000010\n",
                            "speech off; nFramesOn 4; activity: 0.250000; activityOn 0.500000"));
}

TEST_F(BufferedVADTest, IsQuietByDefault) {
    start();
    switchOn();
    for (int i = 0; i < 20; ++i) {
        process(0);
    }
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST_F(BufferedVADTest, EmptySpansNeverSwitchOn) {
    start({{"analyzemson", "9"}, {"activityon", "-1"}});
    process(10);
    process(10);
    EXPECT_TRUE(std::isnan(vad.getActivity(false)));
    EXPECT_FALSE(vad.isSpeech());
}

TEST_F(BufferedVADTest, AnEmptyOffSpanNeverSwitchesOff) {
    start({{"analyzemsoff", "0"}, {"activityoff", "2"}});
    switchOn();
    for (int i = 0; i < 20; ++i) {
        process(0);
    }
    EXPECT_TRUE(vad.isSpeech());
}

TEST_F(BufferedVADTest, ThresholdsThatAreNoNumberAreNeverPassed) {
    start({{"activityon", "nan"}});
    for (int i = 0; i < 10; ++i) {
        process(10);
    }
    EXPECT_FALSE(vad.isSpeech());
}

TEST_F(BufferedVADTest, ProcessingBeforeStartDecidesNothing) {
    process(10);
    EXPECT_THAT(frameVad->firstBytes, IsEmpty());
    EXPECT_FALSE(vad.isSpeech());
}

TEST_F(BufferedVADTest, FramesShorterThanAMillisecondAreNeverDecided) {
    frameVad->size = frameVad->step = 31;
    start();
    EXPECT_EQ(0U, vad.getHistory().size());
    process(10);
    EXPECT_THAT(frameVad->firstBytes, IsEmpty());
    EXPECT_FALSE(vad.isSpeech());
}

TEST_F(BufferedVADTest, FramesOrStepsOfNoLengthAreNeverDecided) {
    frameVad->size = 0;
    start();
    process(10);
    frameVad->size = 320;
    frameVad->step = 0;
    vad.start();
    process(10);
    EXPECT_THAT(frameVad->firstBytes, IsEmpty());
    EXPECT_FALSE(vad.isSpeech());
}

TEST_F(BufferedVADTest, AnUnknownFormatIsSurvived) {
    vad.start();
    process(10);
    vad.setSoundDataInfo(Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 0, 0, 0));
    vad.start();
    process(10);
    EXPECT_FALSE(vad.isSpeech());
}

TEST_F(BufferedVADTest, ABufferWithoutARateAddsNoTime) {
    start({{"verboselog", "1"}});
    switchOn();
    vad.process({Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 1, 0, 2, 1600), {}});
    EXPECT_THAT(log.messages(), ElementsAre("speechOn; msSinceSpeechStart 0 minVoiceTimeMs 500"));
}

TEST_F(BufferedVADTest, ClaimedSamplesOfAnyNumberAreSurvived) {
    start();
    switchOn();
    const int most = std::numeric_limits<int>::max();
    vad.process({Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 1, 16000, 2, most), {1, 2, 3}});
    EXPECT_FALSE(vad.isSpeech());
}

TEST_F(BufferedVADTest, AnAbsurdHistoryIsCutTo8Megabytes) {
    vad.setParameter("analyzemson", "-1");
    vad.setSoundDataInfo(monoFormat(16000));
    log.clear();
    vad.start();
    EXPECT_THAT(log.messages(),
                ElementsAre("BufferedVAD: history of 429496729 frames cut to 67108864"));
    EXPECT_EQ(67108864U, vad.getHistory().size());
    process(10);
    EXPECT_EQ(10.0F / 67108864.0F, vad.getActivity(false));
}

TEST_F(BufferedVADTest, TheDumpOfAnAbsurdHistoryIsItsNewestPart) {
    start({{"analyzems", "655370"}, {"verboselog", "2"}});
    ASSERT_EQ(65537U, vad.getHistory().size());
    vad.process(makeMarkedBuffer({1, 1}));
    ASSERT_FALSE(log.messages().empty());
    EXPECT_EQ("0.000031: " + std::string(65534, '0') + "11\n", log.messages().front());
}

TEST_F(BufferedVADTest, AHistoryOf8MegabytesIsNotCut) {
    start({{"analyzems", "671088640"}});
    EXPECT_EQ(67108864U, vad.getHistory().size());
    EXPECT_THAT(log.messages(), IsEmpty());
}

}  // namespace
