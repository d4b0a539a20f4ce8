#include "talvox/impl/VoiceActivityDetector.h"

#include <gmock/gmock.h>

#include <string>
#include <vector>

#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "talvox/impl/BufferedVAD.h"
#include "talvox/impl/VoiceActivityDetectorWebRTC.h"
#include "vad/VadTestSupport.h"

namespace {

using Talvox::BufferedVAD;
using Talvox::FrameVAD;
using Talvox::VoiceActivityDetector;
using Talvox::VoiceActivityDetectorWebRTC;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::AssertCapture;
using TestSupport::AssertReport;
using TestSupport::LogCapture;

using Detector = boost::shared_ptr<VoiceActivityDetector>;

bool isBuffered(const Detector& detector) {
    return dynamic_cast<BufferedVAD*>(detector.get()) != nullptr;
}

bool isWebRtc(const Detector& detector) {
    return dynamic_cast<VoiceActivityDetectorWebRTC*>(detector.get()) != nullptr;
}

/** What creating a detector from the text logs. */
std::vector<std::string> logOf(const std::string& text) {
    const LogCapture log;
    VoiceActivityDetector::create(text);
    return log.messages();
}

/** The minimal detector: only what is pure. */
class MinimalDetector : public VoiceActivityDetector {
  public:
    void setSoundDataInfo(const Sound::SoundDataInfo& /*format*/) override {}
    void start() override {}
    void process(const Sound::SoundDataBuffer& /*buffer*/) override {}
    bool isSpeech() const override { return false; }
    void cancel() override {}
    void setParameter(const std::string& /*name*/, const std::string& /*value*/) override {}
};

TEST(VoiceActivityDetector, HasDefaults) {
    MinimalDetector detector;
    detector.setSessionMode(Sound::Recorder::MODE_GENERAL);
    detector.processNoise(TestSupport::makeMarkedBuffer({1}));
    EXPECT_EQ(0, detector.getLeadingNoiseMS());
}

TEST(VoiceActivityDetector, NoTextGivesTheBufferedDetectorWithDefaults) {
    const LogCapture log;
    const Detector detector = VoiceActivityDetector::create("");
    ASSERT_TRUE(isBuffered(detector));
    EXPECT_EQ(200, detector->getLeadingNoiseMS());
    detector->setSoundDataInfo(TestSupport::monoFormat(16000));
    detector->start();
    EXPECT_EQ(100U, dynamic_cast<BufferedVAD&>(*detector).getHistory().size());
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST(VoiceActivityDetector, TheWebRtcEngineStandsAlone) {
    const LogCapture log;
    const Detector detector = VoiceActivityDetector::create("engine=wrtc;aggressiveness=3");
    EXPECT_TRUE(isWebRtc(detector));
    EXPECT_THAT(log.messages(), ElementsAre("aggressiveness 3"));
}

TEST(VoiceActivityDetector, TheBufferedEngineMayBeNamed) {
    const LogCapture log;
    EXPECT_TRUE(isBuffered(VoiceActivityDetector::create("engine=buffered;subengine=wrtc")));
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST(VoiceActivityDetector, ATokenWithTwoEqualSignsIsLoggedAndSkipped) {
    EXPECT_THAT(logOf("a=b=c;framems=20"),
                ElementsAre("Bad VAD parameter setting: a=b=c", "frameMS 20"));
    EXPECT_THAT(logOf("framems=20=;total==1"), ElementsAre("Bad VAD parameter setting: framems=20=",
                                                           "Bad VAD parameter setting: total==1"));
}

TEST(VoiceActivityDetector, EmptyTokensAddNothing) {
    EXPECT_THAT(logOf(";;"), IsEmpty());
    EXPECT_THAT(logOf(";framems=20;"), ElementsAre("frameMS 20"));
}

TEST(VoiceActivityDetector, NamesIgnoreCaseBlanksAndUnderscores) {
    EXPECT_THAT(logOf("FRAME_MS=20"), ElementsAre("frameMS 20"));
    EXPECT_THAT(logOf("frame ms=20"), ElementsAre("frameMS 20"));
    EXPECT_THAT(logOf("Analyze_Ms On=400"), ElementsAre("analyzeMsOn"));
    EXPECT_THAT(logOf("__F R_A m e MS_=7"), ElementsAre("frameMS 7"));
}

TEST(VoiceActivityDetector, OnlyUnderscoresAndBlanksAreRemoved) {
    EXPECT_THAT(logOf("frame-ms=20"),
                ElementsAre("Unknown WebRTC VAD parameter setting: frame-ms"));
    EXPECT_THAT(logOf("frame\tms=20"),
                ElementsAre("Unknown WebRTC VAD parameter setting: frame\tms"));
}

TEST(VoiceActivityDetector, ValuesAreKeptAsWritten) {
    TestSupport::AssertCapture asserts;
    EXPECT_THAT(logOf("engine= wrtc"),
                ElementsAre("Unknown engine name for VoiceActivityDetector:  wrtc"));
    EXPECT_THAT(logOf("engine=WRTC"),
                ElementsAre("Unknown engine name for VoiceActivityDetector: WRTC"));
}

TEST(VoiceActivityDetector, ANameAloneHasAnEmptyValue) {
    EXPECT_THAT(logOf("framems"), ElementsAre("frameMS 0"));
    EXPECT_THAT(logOf("framems="), ElementsAre("frameMS 0"));
    EXPECT_THAT(logOf("=5"), ElementsAre("Unknown WebRTC VAD parameter setting: "));
}

TEST(VoiceActivityDetector, ALaterTokenReplacesTheValue) {
    EXPECT_THAT(logOf("framems=20;total=5;FRAME MS=30"), ElementsAre("frameMS 30", "total 5"));
}

TEST(VoiceActivityDetector, ParametersAreAppliedInTheOrderOfTheirNames) {
    EXPECT_THAT(logOf("total=1;verboselog=0;activityon=0.5;individual=2;analyzems=900"),
                ElementsAre("activityOn 0.500000", "analyzeMS 900", "individual 2", "total 1",
                            "verboseLevel 0"));
}

TEST(VoiceActivityDetector, AnUnknownSubengineIsLoggedAndReplaced) {
    EXPECT_THAT(logOf("subengine=foo"), ElementsAre("Unknown subengine type for FrameVAD: foo"));
}

TEST(VoiceActivityDetector, ALoneEngineDoesNotKnowASubengine) {
    EXPECT_THAT(logOf("engine=wrtc;subengine=foo"),
                ElementsAre("Unknown WebRTC VAD parameter setting: subengine"));
}

TEST(VoiceActivityDetector, AnUnknownEngineIsLoggedReplacedAndAsserted) {
    AssertCapture asserts;
    const LogCapture log;
    EXPECT_TRUE(isBuffered(VoiceActivityDetector::create("engine=magic;subengine=foo;framems=20")));
    EXPECT_THAT(log.messages(),
                ElementsAre("Unknown engine name for VoiceActivityDetector: magic", "frameMS 20"));
    EXPECT_THAT(asserts.reports(), ElementsAre(AssertReport{"aValue == \"buffered\"",
                                                            "talvox/impl/BufferedVAD", 174}));
}

TEST(VoiceActivityDetector, AnEmptyEngineNameIsUnknown) {
    AssertCapture asserts;
    EXPECT_THAT(logOf("engine"), ElementsAre("Unknown engine name for VoiceActivityDetector: "));
    EXPECT_EQ(1U, asserts.count());
}

TEST(VoiceActivityDetector, ADecoratorGetsTheFrameDetectorInside) {
    const LogCapture log;
    std::vector<FrameVAD*> seen;
    const auto note = [&seen](const boost::shared_ptr<FrameVAD>& frameVad) {
        seen.push_back(frameVad.get());
        return frameVad;
    };
    const Detector buffered = VoiceActivityDetector::create("", note);
    const Detector alone = VoiceActivityDetector::create("engine=wrtc", note);
    ASSERT_EQ(2U, seen.size());
    EXPECT_TRUE(isBuffered(buffered));
    EXPECT_EQ(alone.get(), seen[1]);
}

TEST(VoiceActivityDetector, PercentSignsInTheTextAreNoFormats) {
    EXPECT_THAT(logOf("%s%n=1;a=%s=%n"), ElementsAre("Bad VAD parameter setting: a=%s=%n",
                                                     "Unknown WebRTC VAD parameter setting: %s%n"));
}

}  // namespace
