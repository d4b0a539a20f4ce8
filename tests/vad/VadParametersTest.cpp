#include "talvox/VadParameters.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <cstdio>
#include <functional>
#include <iterator>
#include <map>
#include <string>
#include <vector>

#include "support/LogCapture.h"
#include "talvox/VadAnalysis.h"
#include "talvox/impl/BufferedVAD.h"
#include "talvox/impl/VoiceActivityDetector.h"
#include "talvox/impl/VoiceActivityDetectorWebRTC.h"
#include "vad/VadTestSupport.h"

namespace {

using Talvox::ListeningStep;
using Talvox::VadParameter;
using Talvox::VadParameters;
using ::testing::Contains;
using ::testing::Each;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;
using TestSupport::LogCapture;
using Texts = std::vector<std::string>;

Texts mistakesOf(const std::string& text) {
    return VadParameters::findMistakes(text, 16000);
}

std::string numberText(const VadParameter& parameter, double value) {
    if (parameter.type != VadParameter::NUMBER) {
        return std::to_string(static_cast<int>(value));
    }
    char text[64];
    std::snprintf(text, sizeof text, "%.9g", value);
    return text;
}

std::vector<VadParameter> numbers() {
    std::vector<VadParameter> found;
    std::copy_if(
        VadParameters::all().begin(), VadParameters::all().end(), std::back_inserter(found),
        [](const VadParameter& parameter) { return parameter.type != VadParameter::NAME; });
    return found;
}

/** Buffers of 21 s of faint noise with speech of 4 s after the first. */
const std::vector<Sound::SoundDataBuffer>& soundWithSpeech() {
    static const std::vector<Sound::SoundDataBuffer> buffers = [] {
        TestSupport::Samples sound(std::size_t{21} * 16000);
        const TestSupport::Samples& speech = TestSupport::speechLike(16000, 4000);
        std::copy(speech.begin(), speech.end(), sound.begin() + 16000);
        TestSupport::NoiseSource noise(3);
        for (int16_t& sample : sound) {
            sample = static_cast<int16_t>(sample + 20 * noise.next());
        }
        return TestSupport::cutIntoBuffers(sound, 16000);
    }();
    return buffers;
}

/** The steps of a session that hears this sound, and when each came first. */
std::map<ListeningStep, int64_t> listen(const std::string& text) {
    static std::map<std::string, std::map<ListeningStep, int64_t>> known;
    std::map<ListeningStep, int64_t>& steps = known[text];
    if (!steps.empty()) {
        return steps;
    }
    const LogCapture log;
    Talvox::VadAnalyzer analyzer(text, 16000);
    for (const Sound::SoundDataBuffer& buffer : soundWithSpeech()) {
        const Talvox::VadBufferAnalysis analysis = analyzer.analyze(buffer);
        steps.emplace(analysis.step, analysis.arrivalMs);
        if (analysis.step == ListeningStep::NO_VOICE ||
            analysis.step == ListeningStep::LISTENING_ENDS) {
            break;
        }
    }
    return steps;
}

bool neverBegins(const std::string& text) {
    return listen(text).count(ListeningStep::NO_VOICE) > 0;
}

bool neverEnds(const std::string& text) {
    return listen(text).count(ListeningStep::SPEECH_BEGINS) > 0 &&
           listen(text)[ListeningStep::LISTENING_ENDS] > 20000;
}

bool endsAtOnce(const std::string& text) {
    const std::map<ListeningStep, int64_t> steps = listen(text);
    return steps.at(ListeningStep::LISTENING_ENDS) - steps.at(ListeningStep::SPEECH_BEGINS) == 600;
}

bool beginsWithTheFirstBuffer(const std::string& text) {
    return listen(text)[ListeningStep::SPEECH_BEGINS] == 320;
}

/** Speech is never found, or everything is speech. */
bool isOff(const std::string& text) {
    return neverBegins(text) ||
           (listen(text)[ListeningStep::SPEECH_BEGINS] <= 520 && neverEnds(text));
}

bool zeroIsUsed(const std::string& text) {
    return listen(text) == listen(text.substr(0, text.find('=')) + "=0");
}

// Each consequence that the table names, and whether a text has it.
const std::map<std::string, std::function<bool(const std::string&)>> CONSEQUENCES = {
    {"speech never begins", neverBegins},
    {"speech never ends", neverEnds},
    {"speech ends as soon as minvoicetimems has passed", endsAtOnce},
    {"speech begins with the first buffer", beginsWithTheFirstBuffer},
    {"detection is off", isOff},
    {"0 is used", zeroIsUsed},
};

void expectConsequence(const std::string& text, const std::string& consequence) {
    const auto found = CONSEQUENCES.find(consequence);
    if (found != CONSEQUENCES.end()) {
        EXPECT_TRUE(found->second(text)) << text << ": " << consequence;
    }
}

void expectOutOfRange(const VadParameter& parameter, double value, const std::string& consequence) {
    const std::string text = parameter.name + '=' + numberText(parameter, value);
    const std::string mistake = text + " is out of range (" + parameter.range + ')';
    EXPECT_THAT(mistakesOf(text),
                Contains(consequence.empty() ? mistake : mistake + ": " + consequence));
    expectConsequence(text, consequence);
}

TEST(VadParameters, EveryOneIsKnownToTheDetector) {
    for (const VadParameter& parameter : VadParameters::all()) {
        const LogCapture log;
        const bool isName = parameter.type == VadParameter::NAME;
        const std::string value =
            isName ? parameter.byDefault : numberText(parameter, parameter.lowest);
        Talvox::VoiceActivityDetector::create(parameter.name + '=' + value);
        EXPECT_EQ(log.messages().size(), isName ? 0U : 1U) << parameter.name;
        EXPECT_THAT(log.messages(), Each(Not(HasSubstr("Unknown")))) << parameter.name;
        EXPECT_FALSE(parameter.meaning.empty() || parameter.range.empty()) << parameter.name;
    }
}

TEST(VadParameters, DefaultsAreTheDetectors) {
    const std::map<std::string, double> expected = {
        {"analyzemson", Talvox::BufferedVAD::ANALYZE_MS_ON_DFLT},
        {"analyzemsoff", Talvox::BufferedVAD::ANALYZE_MS_OFF_DFLT},
        {"analyzems", Talvox::BufferedVAD::ANALYZE_MS_OFF_DFLT},
        {"activityon", Talvox::BufferedVAD::ACTIVITY_ON_DFLT},
        {"activityoff", Talvox::BufferedVAD::ACTIVITY_OFF_DFLT},
        {"minvoicetimems", Talvox::BufferedVAD::MIN_VOICE_TIME_MS_DFLT},
        {"framems", Talvox::VoiceActivityDetectorWebRTC::FRAME_MS_DFLT},
        {"aggressiveness", Talvox::VoiceActivityDetectorWebRTC::AGGRESSIVENESS_DFLT},
        {"verboselog", 0},
    };
    std::size_t compared = 0;
    for (const VadParameter& parameter : numbers()) {
        const auto found = expected.find(parameter.name);
        if (found != expected.end()) {
            EXPECT_EQ(std::stod(parameter.byDefault), found->second) << parameter.name;
            EXPECT_THAT(mistakesOf(parameter.name + '=' + parameter.byDefault), IsEmpty());
            ++compared;
        } else {
            EXPECT_EQ(parameter.byDefault, "by the noise") << parameter.name;
        }
    }
    EXPECT_EQ(compared, expected.size());
}

TEST(VadParameters, ValuesAtTheEndsOfTheRangeAreInIt) {
    for (const VadParameter& parameter : numbers()) {
        for (const double value : {parameter.lowest, parameter.highest}) {
            EXPECT_THAT(mistakesOf(parameter.name + '=' + numberText(parameter, value)),
                        Each(Not(HasSubstr("out of range"))));
        }
    }
}

TEST(VadParameters, ValuesOutOfRangeAreNamedWithWhatTheyLeadTo) {
    for (const VadParameter& parameter : numbers()) {
        if (parameter.type == VadParameter::NUMBER) {
            expectOutOfRange(parameter, parameter.lowest - 0.01, parameter.below);
            expectOutOfRange(parameter, parameter.highest + 0.01, parameter.above);
            continue;
        }
        expectOutOfRange(parameter, parameter.highest + 1, parameter.above);
        if (parameter.type == VadParameter::INTEGER) {
            expectOutOfRange(parameter, parameter.lowest - 1, parameter.below);
        } else {
            expectOutOfRange(parameter, -1, parameter.above);
            if (parameter.lowest > 0) {
                expectOutOfRange(parameter, parameter.lowest - 1, parameter.below);
                expectOutOfRange(parameter, 0, parameter.below);
            }
        }
        for (double value = parameter.lowest + 1; parameter.step > 1 && value < parameter.highest;
             value += parameter.step) {
            expectOutOfRange(parameter, value, parameter.below);
        }
    }
    EXPECT_TRUE(isOff("framems=101"));
}

TEST(VadParameters, DetectionWorksWithEveryUsefulFrameLength) {
    for (const VadParameter& parameter : numbers()) {
        for (double value = parameter.lowest;
             parameter.name == "framems" && value <= parameter.highest; value += parameter.step) {
            EXPECT_FALSE(isOff("framems=" + numberText(parameter, value))) << value;
        }
    }
}

TEST(VadParameters, WhatIsNoNumberCountsAsZero) {
    for (const VadParameter& parameter : numbers()) {
        for (const char* value : {"x", "", "-"}) {
            const std::string text = parameter.name + '=' + value;
            EXPECT_THAT(mistakesOf(text), Contains(text + " is not a number and counts as 0"));
        }
    }
    EXPECT_THAT(mistakesOf("activityon"),
                ElementsAre("activityon= is not a number and counts as 0"));
    EXPECT_THAT(mistakesOf("activityon=nan"),
                ElementsAre("activityon=nan is not a number and is never reached"));
    EXPECT_THAT(mistakesOf("activityon=0,9"),
                ElementsAre("activityon=0,9 counts as 0: the rest is not part of the number"));
    EXPECT_THAT(mistakesOf("framems=20ms"),
                ElementsAre("framems=20ms counts as 20: the rest is not part of the number"));
}

TEST(VadParameters, NamesAndSettingsThatCountForNothingAreFound) {
    EXPECT_THAT(mistakesOf("a=b=c"), ElementsAre("a=b=c has more than one \"=\" and is ignored"));
    EXPECT_THAT(mistakesOf("Colour=red"), ElementsAre("there is no parameter \"colour\""));
    EXPECT_THAT(mistakesOf("engine=ears"), ElementsAre("engine=ears is unknown; buffered is used"));
    EXPECT_THAT(mistakesOf("subengine=foo"), ElementsAre("subengine=foo is unknown; wrtc is used"));
    EXPECT_THAT(mistakesOf("FRAME_MS=20;frame ms=30"),
                ElementsAre("framems is given more than once; the last value counts"));
    EXPECT_THAT(mistakesOf("analyzems=800;analyzemsoff=900"),
                ElementsAre("analyzems has no effect beside analyzemsoff"));
}

TEST(VadParameters, TheLoneEngineHasFewerOfThem) {
    for (const VadParameter& parameter : VadParameters::all()) {
        if (parameter.name == "engine" || parameter.byDefault == "by the noise") {
            continue;
        }
        const std::string text = "engine=wrtc;" + parameter.name + '=' + parameter.byDefault;
        if (parameter.isOfBufferedOnly) {
            EXPECT_THAT(mistakesOf(text),
                        ElementsAre(parameter.name + " has no effect with engine=wrtc"));
        } else {
            EXPECT_THAT(mistakesOf(text), IsEmpty()) << text;
        }
    }
}

TEST(VadParameters, ThresholdsOfTheFrameDetectorGoTogether) {
    EXPECT_THAT(mistakesOf("individual=98;total=1200;overhangmax1=5;overhangmax2=8"), IsEmpty());
    EXPECT_THAT(mistakesOf("total=1000"),
                ElementsAre("total without individual, overhangmax1, overhangmax2: those are 0 "
                            "then"));
    EXPECT_THAT(mistakesOf("individual=0;total=0"),
                ElementsAre("individual, total: thresholds that are all 0 count as not given"));
    EXPECT_THAT(
        mistakesOf("individual=98;total=1200;overhangmax1=5;overhangmax2=8;aggressiveness=1"),
        ElementsAre("aggressiveness has no effect beside individual, total, overhangmax1, "
                    "overhangmax2"));
}

TEST(VadParameters, SpansThatHoldNoFrameAreFound) {
    for (const char* name : {"analyzemson", "analyzems", "analyzemsoff"}) {
        const std::string text = std::string(name) + "=15;framems=20";
        const bool isOn = std::string(name) == "analyzemson";
        EXPECT_THAT(mistakesOf(text),
                    ElementsAre(std::string(name) + "=15 is shorter than a frame of 20 ms: " +
                                (isOn ? "speech never begins" : "speech never ends")));
        EXPECT_TRUE(isOn ? neverBegins(text) : neverEnds(text)) << text;
        EXPECT_THAT(mistakesOf(std::string(name) + "=20;framems=20"), IsEmpty());
    }
}

TEST(VadParameters, ThresholdsThatCannotBeReachedInTimeAreFound) {
    // 480 frames are decided in the 5 s: the buffers from the third to the fiftieth.
    EXPECT_THAT(mistakesOf("activityon=0.5;analyzemson=9590"), IsEmpty());
    EXPECT_THAT(mistakesOf("activityon=0.5;analyzemson=9600"),
                ElementsAre("more than 0.5 of 9600 ms do not fit into the 5 s in which a session "
                            "waits for speech: speech never begins"));
    const LogCapture log;
    for (const int spanMs : {9590, 9600}) {
        Talvox::VadAnalyzer analyzer("activityon=0.5;analyzemson=" + std::to_string(spanMs), 44100);
        bool hasBegun = false;
        // At this rate every frame counts as speech.
        for (const Sound::SoundDataBuffer& buffer :
             TestSupport::cutIntoBuffers(TestSupport::Samples(std::size_t{5} * 44100, 1), 44100)) {
            hasBegun = hasBegun || analyzer.analyze(buffer).isSpeech;
        }
        EXPECT_EQ(hasBegun, spanMs == 9590);
    }
}

TEST(VadParameters, RatesAtWhichNothingIsDecidedAreFound) {
    for (const int rate : {8000, 16000, 32000}) {
        EXPECT_THAT(VadParameters::findMistakes("", rate), IsEmpty()) << rate;
    }
    EXPECT_THAT(VadParameters::findMistakes("", 11025),
                ElementsAre("at 11025 Hz every frame counts as speech; the detector knows 8000, "
                            "16000 and 32000 Hz"));
}

TEST(VadParameters, GoodTextsHaveNone) {
    for (const char* text :
         {"", ";;", "engine=buffered;subengine=wrtc", "subengine=", "engine=wrtc;aggressiveness=3",
          "Analyze_Ms On=300;activityon=0.4;activityoff=0.1;minvoicetimems=300;framems=30"}) {
        EXPECT_THAT(mistakesOf(text), IsEmpty()) << text;
    }
}

TEST(VadParameters, AnyTextIsSurvived) {
    for (const char* text : {"=", "==", "engine", "\xff\xfe=%s%n", "analyzemson=-2147483648",
                             "framems=99999999999999999999", "activityon=1e999;analyzemson=1"}) {
        mistakesOf(text);
        VadParameters::findMistakes(text, -1);
    }
}

}  // namespace
