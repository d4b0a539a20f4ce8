// The pages that the tool writes, against the files in docs.
#include <gmock/gmock.h>

#include <string>

#include "cli/DetectorPage.h"
#include "cli/SettingsPage.h"
#include "cli/ToolProcess.h"
#include "support/ScratchDirectory.h"
#include "talvox/SettingsTable.h"
#include "talvox/VadParameters.h"

namespace {

using ::testing::HasSubstr;
using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;

const std::string DOCS = std::string(PROJECT_DIR) + "/docs/";

TEST(Pages, TheSettingsPageIsThatOfTheTable) {
    EXPECT_EQ(ScratchDirectory::read(DOCS + "SETTINGS.md"), Cli::settingsPage())
        << "./dev pages writes it";
}

TEST(Pages, TheDetectorPageIsThatOfTheTable) {
    EXPECT_EQ(ScratchDirectory::read(DOCS + "DETECTOR.md"), Cli::detectorPage())
        << "./dev pages writes it";
}

TEST(Pages, TheToolPrintsThem) {
    EXPECT_EQ(runTalvox({"settings", "--markdown", "settings"}).out, Cli::settingsPage());
    EXPECT_EQ(runTalvox({"settings", "--markdown", "detector"}).out, Cli::detectorPage());
    EXPECT_EQ(runTalvox({"settings", "--markdown", "poetry"}).status, 2);
}

TEST(Pages, EveryRepairOfTheSettingsPageIsWhatValidationDoes) {
    const std::string page = Cli::settingsPage();
    EXPECT_THAT(page, HasSubstr("- A bad value becomes 16000. Log: `TalvoxSettings::validate: bad "
                                "sampleRate: VALUE, setting to default`\n"));
    EXPECT_THAT(page, HasSubstr("- A bad value becomes `enabled`. Log: `TalvoxSettings::validate: "
                                "bad eventsLoggingPolicy: VALUE, setting to default`\n"));
    EXPECT_THAT(page, HasSubstr("- A bad value becomes 0 or 10, whichever is nearer. Log: "));
    EXPECT_THAT(page, HasSubstr("- A bad value becomes 0.2, or 0 if `upperconfidence` is not above "
                                "that. Log: "));
    EXPECT_THAT(page,
                HasSubstr("- A bad value stays. Log: `TalvoxSettings::validate: empty url`\n"));
    EXPECT_THAT(page, HasSubstr("- A bad value stays. Log: `TalvoxSettings::validate: bad uuid "
                                "VALUE`\n"));
}

TEST(Pages, TheHelpOfTheSettingsNamesEachWithItsValues) {
    const std::string help = runTalvox({"settings", "--help"}).out;
    for (const Talvox::SettingRow* row = Talvox::SettingsTable::rows; row->key != nullptr; ++row) {
        EXPECT_THAT(help, HasSubstr(std::string("\n  ") + row->key + " "));
    }
    EXPECT_THAT(help, HasSubstr("  samplerate            8000 to 44100 [16000] Hz\n"));
    EXPECT_EQ(help.find('`'), std::string::npos);
}

}  // namespace
