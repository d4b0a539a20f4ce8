// "talvox vad" over sound with one stretch of something voice-like in it.
#include <gmock/gmock.h>
#include <sndfile.h>

#include <csignal>
#include <nlohmann/json.hpp>
#include <sstream>

#include "SoundFiles.h"
#include "ToolProcess.h"
#include "support/ScratchDirectory.h"

namespace {

using ::testing::HasSubstr;
using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;
using TestSupport::ToolResult;

/** One second of silence, one and a half of voice, one and a half of silence. */
std::vector<int16_t> utterance(int sampleRateHz) {
    std::vector<int16_t> samples(static_cast<std::size_t>(sampleRateHz), 0);
    const std::vector<int16_t> voice = TestSupport::voiceLike(sampleRateHz, 1.5);
    samples.insert(samples.end(), voice.begin(), voice.end());
    samples.insert(samples.end(), static_cast<std::size_t>(sampleRateHz) * 3 / 2, 0);
    return samples;
}

std::vector<nlohmann::json> objects(const std::string& text, const std::string& event) {
    std::vector<nlohmann::json> found;
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);) {
        nlohmann::json object = nlohmann::json::parse(line);
        if (object["event"] == event) {
            found.push_back(object);
        }
    }
    return found;
}

void expectOneUtterance(const ToolResult& result) {
    ASSERT_EQ(result.status, 0) << result.err;
    const std::vector<nlohmann::json> buffers = objects(result.out, "buffer");
    ASSERT_EQ(buffers.size(), 40U);
    for (std::size_t index = 0; index < buffers.size(); ++index) {
        const nlohmann::json& buffer = buffers[index];
        EXPECT_EQ(buffer["startMs"], index * 100);
        EXPECT_EQ(buffer["endMs"], (index + 1) * 100);
        EXPECT_EQ(buffer["frames"].get<std::string>().size(),
                  buffer["learningNoise"].get<bool>() ? 0U : 10U);
    }
    EXPECT_TRUE(buffers[0]["learningNoise"].get<bool>());
    EXPECT_FALSE(buffers[4]["learningNoise"].get<bool>());
    EXPECT_LT(buffers[9]["level"].get<double>(), buffers[20]["level"].get<double>());

    const std::vector<nlohmann::json> segments = objects(result.out, "segment");
    ASSERT_EQ(segments.size(), 1U);
    EXPECT_GE(segments[0]["startMs"], 1000);
    EXPECT_LE(segments[0]["startMs"], 1700);
    EXPECT_GE(segments[0]["endMs"], 2500);
    EXPECT_LE(segments[0]["endMs"], 3700);
    EXPECT_TRUE(segments[0]["ended"].get<bool>());
}

TEST(ToolVad, FindsTheUtteranceInRawSound) {
    expectOneUtterance(
        runTalvox({"vad", "--file", "-", "--json"}, TestSupport::rawBytes(utterance(16000))));
}

TEST(ToolVad, FindsTheUtteranceInAFileOfAnotherRate) {
    const ScratchDirectory directory;
    const std::string path = directory.path("a.wav");
    ASSERT_TRUE(TestSupport::writeSoundFile(path, SF_FORMAT_WAV | SF_FORMAT_PCM_16, 44100, 1,
                                            utterance(44100)));
    expectOneUtterance(runTalvox({"vad", "--file", path, "--json"}));
}

TEST(ToolVad, FindsTheUtteranceAt8kHz) {
    expectOneUtterance(runTalvox({"vad", "--file", "-", "--rate", "8000", "--json"},
                                 TestSupport::rawBytes(utterance(8000))));
}

TEST(ToolVad, PrintsATableForReaders) {
    const ToolResult result =
        runTalvox({"vad", "--file", "-"}, TestSupport::rawBytes(utterance(16000)));
    EXPECT_EQ(result.status, 0);
    EXPECT_THAT(result.out, HasSubstr("     0 ms  [--------------------]  silence       -  noise"));
    EXPECT_THAT(result.out, HasSubstr("  speech  1"));
    EXPECT_THAT(result.out, HasSubstr("\nsegments of speech:\n  1"));
}

TEST(ToolVad, FollowsTheDetectorsParameters) {
    const std::string sound = TestSupport::rawBytes(utterance(16000));
    const ToolResult coarse =
        runTalvox({"vad", "--file", "-", "--json", "--vad", "framems=30"}, sound);
    EXPECT_EQ(objects(coarse.out, "buffer")[10]["frames"].get<std::string>().size(), 3U);
    const ToolResult deaf =
        runTalvox({"vad", "--file", "-", "--json", "--vad", "activityon=1.0"}, sound);
    EXPECT_TRUE(objects(deaf.out, "segment").empty());
    const ToolResult bySet =
        runTalvox({"vad", "--file", "-", "--json", "--set", "vad=activityon=1.0"}, sound);
    EXPECT_EQ(bySet.out, deaf.out);
}

TEST(ToolVad, PutsSilenceBeforeTheSound) {
    const std::string sound = TestSupport::rawBytes(utterance(16000));
    const ToolResult plain = runTalvox({"vad", "--file", "-", "--json"}, sound);
    const ToolResult later = runTalvox({"vad", "--file", "-", "--json", "--lead-in", "700"}, sound);
    EXPECT_EQ(objects(later.out, "buffer").size(), objects(plain.out, "buffer").size() + 7);
    const nlohmann::json before = objects(plain.out, "segment").at(0);
    const nlohmann::json behind = objects(later.out, "segment").at(0);
    EXPECT_EQ(behind["startMs"].get<int>(), before["startMs"].get<int>() + 700);
}

TEST(ToolVad, RecognizeWarnsOfMistakesInTheParametersToo) {
    const ToolResult result =
        runTalvox({"recognize", "--file", "/nonexistent.wav", "--vad", "framems=25"});
    EXPECT_EQ(result.status, 2);
    EXPECT_THAT(result.err,
                ::testing::StartsWith("talvox: warning: vad: framems=25 is out of range "
                                      "(10, 20 or 30): detection is off\ntalvox: "));
}

TEST(ToolVad, RunsWithADocumentOfNumbersBeyondRangeAndTellsItsRepairs) {
    const ScratchDirectory directory;
    const std::string file =
        directory.write("settings.xml",
                        "<startup><features><voice><samplerate>96000</samplerate>"
                        "<vad>activityon=1.0</vad></voice></features></startup>");
    const ToolResult result = runTalvox({"vad", "--file", "-", "--json", "--settings", file},
                                        TestSupport::rawBytes(utterance(16000)));
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(
        result.err,
        "talvox: TalvoxSettings::validate: bad sampleRate: 96000, setting to default\n"
        "talvox: warning: vad: activityon=1.0 is out of range (0 to less than 1): speech never "
        "begins\n"
        "talvox: activityOn 1.000000\n");
    EXPECT_EQ(objects(result.out, "buffer").size(), 40U);
    EXPECT_TRUE(objects(result.out, "segment").empty());
}

TEST(ToolVad, AnUnknownEngineBreaksAnInvariantWhichEndsTheToolInADebugBuildOnly) {
    const ToolResult unknown = runTalvox({"vad", "--file", "-", "--vad", "engine=ears"},
                                         TestSupport::rawBytes(utterance(16000)));
    EXPECT_THAT(unknown.err,
                HasSubstr("talvox: Unknown engine name for VoiceActivityDetector: ears\n"));
    EXPECT_THAT(unknown.err,
                HasSubstr("talvox: warning: vad: engine=ears is unknown; buffered is used\n"));
    EXPECT_THAT(unknown.err, HasSubstr("talvox: assertion failed: aValue == \"buffered\" "
                                       "(talvox/impl/BufferedVAD:174)\n"));
#ifdef NDEBUG
    EXPECT_EQ(unknown.status, 0);
#else
    EXPECT_EQ(unknown.status, 128 + SIGABRT);
#endif
}

TEST(ToolVad, SurvivesAndTellsMistakesInTheParameters) {
    const std::string sound = TestSupport::rawBytes(utterance(16000));
    const ToolResult unknown =
        runTalvox({"vad", "--file", "-", "--vad", "colour=red;a=b=c"}, sound);
    EXPECT_EQ(unknown.status, 0);
    EXPECT_THAT(unknown.err, HasSubstr("talvox: Bad VAD parameter setting: a=b=c\n"));
    EXPECT_THAT(unknown.err, HasSubstr("talvox: Unknown WebRTC VAD parameter setting: colour\n"));
    for (const char* warning :
         {"a=b=c has more than one \"=\" and is ignored", "there is no parameter \"colour\""}) {
        EXPECT_THAT(unknown.err, HasSubstr("talvox: warning: vad: " + std::string(warning) + '\n'));
    }
    for (const char* text : {"framems=0", "framems=-5", "framems=1000000000", "analyzemson=0",
                             "analyzemsoff=0;analyzemson=0", "engine=wrtc;framems=7"}) {
        EXPECT_EQ(runTalvox({"vad", "--file", "-", "--vad", text}, sound).status, 0) << text;
    }
}

}  // namespace
