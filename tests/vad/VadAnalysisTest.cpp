#include "talvox/VadAnalysis.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <cmath>
#include <string>
#include <utility>
#include <vector>

#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "talvox/impl/VoiceActivityDetector.h"
#include "talvox/impl/VoicePowerEstimator.h"
#include "vad/VadTestSupport.h"

namespace {

using Talvox::ListeningStep;
using Talvox::VadAnalyzer;
using Talvox::VadBufferAnalysis;
using Talvox::VadSegment;
using TestSupport::cutIntoBuffers;
using TestSupport::LogCapture;
using TestSupport::Samples;
using TestSupport::speechLike;

/** A second of faint noise, the sound, and two seconds of faint noise. */
Samples betweenPauses(const Samples& sound, int rate) {
    TestSupport::NoiseSource noise(5);
    Samples samples(static_cast<std::size_t>(rate));
    samples.insert(samples.end(), sound.begin(), sound.end());
    samples.resize(samples.size() + 2 * static_cast<std::size_t>(rate));
    for (int16_t& sample : samples) {
        sample = static_cast<int16_t>(sample + 20 * noise.next());
    }
    return samples;
}

std::vector<VadBufferAnalysis> analyzeAll(VadAnalyzer& analyzer, const Samples& samples, int rate) {
    std::vector<VadBufferAnalysis> analyses;
    for (const Sound::SoundDataBuffer& buffer : cutIntoBuffers(samples, rate)) {
        analyses.push_back(analyzer.analyze(buffer));
    }
    return analyses;
}

TEST(VadAnalysis, LearnsFromTheLeadingNoiseFirst) {
    VadAnalyzer analyzer("", 16000);
    const auto analyses = analyzeAll(analyzer, TestSupport::makeSquareWave(16000, 500), 16000);
    ASSERT_EQ(10U, analyses.size());
    for (std::size_t i = 0; i < analyses.size(); ++i) {
        EXPECT_EQ(static_cast<int64_t>(i) * 100, analyses[i].startMs);
        EXPECT_EQ(static_cast<int64_t>(i) * 100 + 100, analyses[i].endMs);
        EXPECT_EQ(i < 2, analyses[i].learningNoise);
        EXPECT_EQ(i < 2 ? 0U : 10U, analyses[i].decisions.size());
    }
    EXPECT_NEAR(10 * std::log10(2 * 250000.0) - 45, analyses[1].level, 0.001);
}

/** How many buffers of the sound the detector learns from. */
std::ptrdiff_t countLearnt(int rate, int deviceDelayMs) {
    VadAnalyzer analyzer("", rate, Sound::Recorder::MODE_VOICE_RECOGNITION, deviceDelayMs);
    const Samples second(static_cast<std::size_t>(rate), 100);
    const auto analyses = analyzeAll(analyzer, second, rate);
    return std::count_if(analyses.begin(), analyses.end(),
                         [](const VadBufferAnalysis& analysis) { return analysis.learningNoise; });
}

TEST(VadAnalysis, LearnsFromTheBuffersThatArriveUntilMoreThanTheLeadingNoiseHasPassed) {
    for (const int rate : {8000, 11025, 16000, 44100}) {
        EXPECT_EQ(countLearnt(rate, 20), 2) << rate;
        EXPECT_EQ(countLearnt(rate, 100), 2) << rate;
        EXPECT_EQ(countLearnt(rate, 0), 3) << rate;
        EXPECT_EQ(countLearnt(rate, 102), 1) << rate;
    }
    EXPECT_EQ(countLearnt(16000, 1), 2);
    EXPECT_EQ(countLearnt(16000, 101), 1);
}

TEST(VadAnalysis, ArrivalIsTheDelayAfterTheLastSample) {
    VadAnalyzer analyzer("", 11025);
    const auto analyses = analyzeAll(analyzer, Samples(11025, 0), 11025);
    ASSERT_EQ(analyses.size(), 10U);
    EXPECT_EQ(analyses[1].endMs, 199);
    EXPECT_EQ(analyses[1].arrivalMs, 219);
    EXPECT_EQ(analyses[1].step, ListeningStep::RECORDING_BEGINS);
    EXPECT_EQ(analyses[9].endMs, 999);
    EXPECT_EQ(analyses[9].arrivalMs, 1019);
}

/** When a session's listening ends for the first time, and by which step. */
std::pair<int64_t, ListeningStep> findEnd(const std::string& parameters, int rate) {
    const LogCapture log;
    VadAnalyzer analyzer(parameters, rate);
    for (const VadBufferAnalysis& analysis :
         analyzeAll(analyzer, Samples(static_cast<std::size_t>(rate) * 25, 0), rate)) {
        if (analysis.step == ListeningStep::LISTENING_ENDS ||
            analysis.step == ListeningStep::NO_VOICE) {
            return {analysis.arrivalMs, analysis.step};
        }
    }
    return {-1, ListeningStep::GO_ON};
}

TEST(VadAnalysis, ShowsTheLimitsOfASession) {
    const char* const never = "activityon=2";
    const char* const endless = "activityon=-1;activityoff=-1";
    EXPECT_EQ(findEnd(never, 16000), std::make_pair(int64_t{5020}, ListeningStep::NO_VOICE));
    EXPECT_EQ(findEnd(never, 11025), std::make_pair(int64_t{5017}, ListeningStep::NO_VOICE));
    EXPECT_EQ(findEnd(endless, 16000),
              std::make_pair(int64_t{20120}, ListeningStep::LISTENING_ENDS));
    // 203 buffers of 1102 samples: each counts as 99 ms.
    EXPECT_EQ(findEnd(endless, 11025),
              std::make_pair(int64_t{20310}, ListeningStep::LISTENING_ENDS));
}

TEST(VadAnalysis, StepsFollowTheStateOfTheBuffers) {
    VadAnalyzer analyzer("", 16000);
    bool wasSpeech = false;
    int begins = 0;
    for (const VadBufferAnalysis& analysis :
         analyzeAll(analyzer, betweenPauses(speechLike(16000, 1500), 16000), 16000)) {
        if (analysis.learningNoise) {
            continue;
        }
        EXPECT_EQ(analysis.step == ListeningStep::SPEECH_BEGINS, analysis.isSpeech && !wasSpeech);
        EXPECT_EQ(analysis.step == ListeningStep::LISTENING_ENDS, !analysis.isSpeech && wasSpeech);
        begins += analysis.step == ListeningStep::SPEECH_BEGINS ? 1 : 0;
        wasSpeech = analysis.isSpeech;
    }
    EXPECT_EQ(begins, 1);
}

TEST(VadAnalysis, FindsWhatTheSessionsDetectorFinds) {
    LogCapture log;
    const std::string parameters = "aggressiveness=3;analyzemson=300;minvoicetimems=200";
    const Samples samples = betweenPauses(speechLike(16000, 4000), 16000);
    const auto detector = Talvox::VoiceActivityDetector::create(parameters);
    detector->setSoundDataInfo(TestSupport::monoFormat(16000));
    detector->setSessionMode(Sound::Recorder::MODE_VOICE_RECOGNITION);
    detector->start();
    Talvox::VoicePowerEstimator estimator;
    estimator.setMode(Sound::Recorder::MODE_VOICE_RECOGNITION);
    VadAnalyzer analyzer(parameters, 16000);
    bool found = false;
    for (const Sound::SoundDataBuffer& buffer : cutIntoBuffers(samples, 16000)) {
        const VadBufferAnalysis analysis = analyzer.analyze(buffer);
        if (analysis.learningNoise) {
            detector->processNoise(buffer);
            estimator.learnNoise(buffer);
            EXPECT_EQ(estimator.getNoiseLevel(), analysis.level);
            continue;
        }
        detector->process(buffer);
        estimator.updatePower(buffer);
        EXPECT_EQ(detector->isSpeech(), analysis.isSpeech);
        EXPECT_EQ(estimator.getLevel(), analysis.level);
        found = found || analysis.isSpeech;
    }
    EXPECT_TRUE(found);
}

TEST(VadAnalysis, SegmentsFollowTheStateOfTheBuffers) {
    VadAnalyzer analyzer("", 16000);
    const Samples samples = betweenPauses(speechLike(16000, 1500), 16000);
    const auto analyses = analyzeAll(analyzer, samples, 16000);
    const auto isSpeech = [](const VadBufferAnalysis& analysis) { return analysis.isSpeech; };
    const auto begin = std::find_if(analyses.begin(), analyses.end(), isSpeech);
    ASSERT_NE(analyses.end(), begin);
    const auto end = std::find_if_not(begin, analyses.end(), isSpeech);
    ASSERT_NE(analyses.end(), end);
    ASSERT_EQ(analyses.end(), std::find_if(end, analyses.end(), isSpeech));
    const std::vector<VadSegment> segments = analyzer.segments();
    ASSERT_EQ(1U, segments.size());
    EXPECT_EQ(begin->endMs, segments[0].startMs);
    EXPECT_EQ(end->endMs, segments[0].endMs);
    EXPECT_GT(segments[0].startMs, 1000);
    EXPECT_GT(segments[0].endMs, 2500);
}

TEST(VadAnalysis, AnOpenSegmentEndsAtTheLastBuffer) {
    LogCapture log;
    VadAnalyzer analyzer("activityoff=-1", 16000);
    analyzeAll(analyzer, betweenPauses(speechLike(16000, 1500), 16000), 16000);
    ASSERT_EQ(1U, analyzer.segments().size());
    EXPECT_EQ(4500, analyzer.segments()[0].endMs);
}

TEST(VadAnalysis, SilenceHasNoSegments) {
    VadAnalyzer analyzer("", 16000);
    analyzeAll(analyzer, Samples(80000, 0), 16000);
    EXPECT_TRUE(analyzer.segments().empty());
}

TEST(VadAnalysis, ShowsTheActivityThatIsComparedWithTheThreshold) {
    VadAnalyzer analyzer("", 16000);
    bool wasSpeech = false;
    std::vector<bool> history(100, false);
    for (const VadBufferAnalysis& analysis :
         analyzeAll(analyzer, betweenPauses(speechLike(16000, 4000), 16000), 16000)) {
        if (analysis.learningNoise) {
            continue;
        }
        history.erase(history.begin(), history.begin() + 10);
        history.insert(history.end(), analysis.decisions.begin(), analysis.decisions.end());
        const std::ptrdiff_t span = wasSpeech ? 100 : 40;
        const auto ones = std::count(history.end() - span, history.end(), true);
        EXPECT_FLOAT_EQ(static_cast<float>(ones) / static_cast<float>(span), analysis.activity);
        wasSpeech = analysis.isSpeech;
    }
    EXPECT_FALSE(analyzer.segments().empty());
}

TEST(VadAnalysis, ShowsTheLoneEngineToo) {
    VadAnalyzer analyzer("engine=wrtc", 16000);
    const Samples samples = betweenPauses(speechLike(16000, 2000), 16000);
    bool found = false;
    for (const VadBufferAnalysis& analysis : analyzeAll(analyzer, samples, 16000)) {
        if (analysis.learningNoise) {
            continue;
        }
        // The frame that ends at the buffer's end is left out, and the last one decides.
        ASSERT_EQ(9U, analysis.decisions.size());
        EXPECT_EQ(analysis.decisions.back(), analysis.isSpeech);
        const auto ones = std::count(analysis.decisions.begin(), analysis.decisions.end(), true);
        EXPECT_FLOAT_EQ(static_cast<float>(ones) / 9.0F, analysis.activity);
        found = found || analysis.isSpeech;
    }
    EXPECT_TRUE(found);
    EXPECT_FALSE(analyzer.segments().empty());
}

TEST(VadAnalysis, LevelIsRelativeInGeneralMode) {
    VadAnalyzer analyzer("", 16000, Sound::Recorder::MODE_GENERAL);
    const auto analyses = analyzeAll(analyzer, TestSupport::makeSquareWave(8000, 500), 16000);
    const double power = 250000.0 * 0.2;
    EXPECT_NEAR(10 * std::log10(power) - 45 - analyses[1].level, analyses[2].level, 0.001);
}

TEST(VadAnalysis, FindsSpeechInARecording) {
    const Samples recording = TestSupport::loadRecordedSpeech("something.raw");
    if (recording.empty()) {
        GTEST_SKIP() << "recorded speech is not installed: "
                     << TestSupport::recordedSpeechPath("something.raw");
    }
    VadAnalyzer analyzer("", 16000);
    analyzeAll(analyzer, betweenPauses(recording, 16000), 16000);
    ASSERT_EQ(1U, analyzer.segments().size());
    const VadSegment segment = analyzer.segments()[0];
    const auto lengthMs = static_cast<int64_t>(recording.size()) / 16;
    EXPECT_GT(segment.startMs, 1000);
    EXPECT_LT(segment.startMs, 2000);
    EXPECT_GT(segment.endMs, 1000 + lengthMs / 2);
    EXPECT_LT(segment.endMs, 1000 + lengthMs + 1500);
}

TEST(VadAnalysis, UnsupportedRatesCountAsSpeech) {
    VadAnalyzer analyzer("", 44100);
    const auto analyses = analyzeAll(analyzer, Samples(44100, 0), 44100);
    EXPECT_TRUE(analyses.back().isSpeech);
}

TEST(VadAnalysis, SurvivesRatesThatAreNone) {
    for (const int rate : {0, -1, -16000}) {
        VadAnalyzer analyzer("", rate);
        for (int i = 0; i < 10; ++i) {
            const VadBufferAnalysis analysis =
                analyzer.analyze(TestSupport::makeBuffer(Samples(1600, 1000), rate));
            EXPECT_EQ(0, analysis.endMs);
            EXPECT_FALSE(analysis.isSpeech);
        }
    }
}

}  // namespace
