// The presets of the detector: whether they are sound, and the same in every language.
#include "talvox/EndOfSpeech.h"

#include <gmock/gmock.h>

#include <regex>
#include <string>

#include "support/ScratchDirectory.h"
#include "talvox/VadParameters.h"

namespace {

using Talvox::EndOfSpeech;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

const std::string PROJECT = PROJECT_DIR;

TEST(EndOfSpeech, PresetsHaveNoMistakes) {
    for (const EndOfSpeech& preset : EndOfSpeech::all()) {
        for (const int rate : {8000, 16000, 32000}) {
            EXPECT_THAT(Talvox::VadParameters::findMistakes(preset.parameters, rate), IsEmpty())
                << preset.name;
        }
    }
}

TEST(EndOfSpeech, PresetsHaveTheirNames) {
    ASSERT_EQ(EndOfSpeech::all().size(), 3U);
    EXPECT_STREQ(EndOfSpeech::all()[0].name, "command");
    EXPECT_EQ(EndOfSpeech::all()[0].parameters, EndOfSpeech::COMMAND);
    EXPECT_STREQ(EndOfSpeech::all()[1].name, "dictation");
    EXPECT_EQ(EndOfSpeech::all()[1].parameters, EndOfSpeech::DICTATION);
    EXPECT_STREQ(EndOfSpeech::all()[2].name, "noisy");
    EXPECT_EQ(EndOfSpeech::all()[2].parameters, EndOfSpeech::NOISY);
}

TEST(EndOfSpeech, PresetsAreTheSameInJavaAndInTheDocument) {
    // Long texts stand there in pieces.
    const std::string java = std::regex_replace(
        TestSupport::ScratchDirectory::read(
            PROJECT + "/platforms/android/java/src/main/java/korvel/talvox/EndOfSpeech.java"),
        std::regex("\"\\s*\\+\\s*\"|=\\s+(?=\")"), "");
    const std::string document =
        TestSupport::ScratchDirectory::read(PROJECT + "/docs/ENDPOINTING.md");
    const auto constant = [](const char* name, const char* parameters) {
        return "String " + std::string(name) + " \"" + parameters + "\";";
    };
    EXPECT_THAT(java, HasSubstr(constant("COMMAND", EndOfSpeech::COMMAND)));
    EXPECT_THAT(java, HasSubstr(constant("DICTATION", EndOfSpeech::DICTATION)));
    EXPECT_THAT(java, HasSubstr(constant("NOISY", EndOfSpeech::NOISY)));
    for (const EndOfSpeech& preset : EndOfSpeech::all()) {
        EXPECT_THAT(document, HasSubstr("| `" + std::string(preset.name) + "` | `" +
                                        preset.parameters + "` |"));
    }
}

}  // namespace
