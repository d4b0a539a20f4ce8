#include "talvox/impl/FrameVAD.h"

#include <gmock/gmock.h>

#include "support/LogCapture.h"
#include "talvox/impl/VoiceActivityDetectorWebRTC.h"
#include "vad/VadTestSupport.h"

namespace {

using Talvox::FrameVAD;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::LogCapture;
using TestSupport::makeMarkedBuffer;
using TestSupport::ScriptedFrameVAD;

/** Only what is pure must be given; shows the defaults of the rest. */
class MinimalFrameVAD : public FrameVAD {
  public:
    void setSoundDataInfo(const Sound::SoundDataInfo& /*format*/) override {}
    void start() override {}
    void cancel() override {}
    void setParameter(const std::string& /*name*/, const std::string& /*value*/) override {}
    unsigned getFrameSizeInBytes() const override { return 77; }
    bool processFrame(const unsigned char* /*frame*/) override { return true; }
};

TEST(FrameVAD, HasDefaults) {
    MinimalFrameVAD vad;
    EXPECT_EQ(77U, vad.getFrameStepInBytes());
    EXPECT_EQ(0, vad.getLeadingNoiseMS());
    EXPECT_FALSE(vad.isSpeech());
    vad.setSessionMode(Sound::Recorder::MODE_GENERAL);
    vad.processNoise(makeMarkedBuffer({1, 1}));
    EXPECT_FALSE(vad.isSpeech());
}

TEST(FrameVAD, LeavesOutTheFrameThatEndsAtTheBuffersEnd) {
    ScriptedFrameVAD vad;
    vad.process(makeMarkedBuffer({1, 2}));
    EXPECT_THAT(vad.firstBytes, ElementsAre(1));
}

TEST(FrameVAD, DecidesEveryFrameThatEndsBefore) {
    ScriptedFrameVAD vad;
    vad.process(makeMarkedBuffer({1, 2, 3}, 1));
    EXPECT_THAT(vad.firstBytes, ElementsAre(1, 2, 3));
}

TEST(FrameVAD, ABufferOfOneFrameOrLessLeavesTheDecision) {
    ScriptedFrameVAD vad;
    vad.process(makeMarkedBuffer({1}, 1));
    ASSERT_TRUE(vad.isSpeech());
    vad.process(makeMarkedBuffer({0}));
    vad.process(makeMarkedBuffer({}, 100));
    vad.process(makeMarkedBuffer({}));
    EXPECT_TRUE(vad.isSpeech());
    EXPECT_THAT(vad.firstBytes, ElementsAre(1));
}

TEST(FrameVAD, CarriesNothingOverToTheNextBuffer) {
    ScriptedFrameVAD vad;
    vad.process(makeMarkedBuffer({1, 2}, 319));
    vad.process(makeMarkedBuffer({3, 4}, 319));
    EXPECT_THAT(vad.firstBytes, ElementsAre(1, 2, 3, 4));
}

TEST(FrameVAD, TheLastFrameDecides) {
    ScriptedFrameVAD vad;
    vad.process(makeMarkedBuffer({1, 1, 0}, 1));
    EXPECT_FALSE(vad.isSpeech());
    vad.process(makeMarkedBuffer({0, 0, 1}, 1));
    EXPECT_TRUE(vad.isSpeech());
}

TEST(FrameVAD, OverlappingFramesAdvanceByTheStep) {
    ScriptedFrameVAD vad(640);
    vad.step = 320;
    vad.process(makeMarkedBuffer({1, 2, 3, 4}));
    EXPECT_THAT(vad.firstBytes, ElementsAre(1, 2));
}

TEST(FrameVAD, StepsBeyondTheBufferEnd) {
    ScriptedFrameVAD vad;
    vad.step = 0xFFFFFFFFU;
    vad.process(makeMarkedBuffer({1, 2, 3}));
    EXPECT_THAT(vad.firstBytes, ElementsAre(1));
}

TEST(FrameVAD, FramesOrStepsOfNoLengthGiveNoDecision) {
    ScriptedFrameVAD noSize(0);
    noSize.process(makeMarkedBuffer({1, 2}));
    EXPECT_THAT(noSize.firstBytes, IsEmpty());
    ScriptedFrameVAD noStep;
    noStep.step = 0;
    noStep.process(makeMarkedBuffer({1, 2}));
    EXPECT_THAT(noStep.firstBytes, IsEmpty());
}

TEST(FrameVAD, CreatesTheWebRtcEngineForItsNameAndForNone) {
    LogCapture log;
    for (const char* name : {"", "wrtc"}) {
        EXPECT_NE(nullptr,
                  dynamic_cast<Talvox::VoiceActivityDetectorWebRTC*>(FrameVAD::create(name).get()));
    }
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST(FrameVAD, AnUnknownEngineIsLoggedAndReplaced) {
    LogCapture log;
    EXPECT_NE(nullptr,
              dynamic_cast<Talvox::VoiceActivityDetectorWebRTC*>(FrameVAD::create("foo").get()));
    EXPECT_THAT(log.messages(), ElementsAre("Unknown subengine type for FrameVAD: foo"));
}

}  // namespace
