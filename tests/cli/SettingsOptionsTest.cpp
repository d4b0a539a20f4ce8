#include "cli/SettingsOptions.h"

#include <gmock/gmock.h>

#include "cli/UsageError.h"
#include "support/LogCapture.h"
#include "support/ScratchDirectory.h"

namespace {

using Cli::assign;
using Cli::buildSettings;
using Cli::SettingsOptions;
using Talvox::Settings;
using TestSupport::LogCapture;
using TestSupport::ScratchDirectory;

std::string refusal(const std::string& key, const std::string& text) {
    Settings settings;
    try {
        assign(settings, key, text);
    } catch (const Cli::UsageError& error) {
        return error.what();
    }
    return "";
}

std::string document(const std::string& body) {
    return "<startup><features><voice>" + body + "</voice></features></startup>";
}

TEST(Assign, StoresEachTypeInTheSyntaxOfADocument) {
    Settings settings;
    assign(settings, "samplerate", "8000");
    EXPECT_EQ(settings.getInt("samplerate"), 8000);
    assign(settings, "samplerate", "0x3E80");
    EXPECT_EQ(settings.getInt("samplerate"), 16000);
    assign(settings, "speexquality", "010");
    EXPECT_EQ(settings.getInt("speexquality"), 8);
    assign(settings, "speexquality", "-3");
    EXPECT_EQ(settings.getInt("speexquality"), -3);
    assign(settings, "upperconfidence", "0.75");
    EXPECT_FLOAT_EQ(settings.getFloat("upperconfidence"), 0.75F);
    assign(settings, "upperconfidence", "1e-1");
    EXPECT_FLOAT_EQ(settings.getFloat("upperconfidence"), 0.1F);
    assign(settings, "myll", "55.75,37.5");
    EXPECT_FLOAT_EQ(settings.getLatLon("myll").lat, 55.75F);
    EXPECT_FLOAT_EQ(settings.getLatLon("myll").lon, 37.5F);
    assign(settings, "vad", "engine=wrtc; framems=20");
    EXPECT_EQ(settings.getString("vad"), "engine=wrtc; framems=20");
    assign(settings, "url", "");
    EXPECT_EQ(settings.getString("url"), "");
    EXPECT_TRUE(settings.conformsTo(Settings::bundleSpecs));
}

TEST(Assign, TakesBooleansInTheirUsualWords) {
    Settings settings;
    for (const char* text : {"true", "yes", "1", "on", "TRUE", "Yes"}) {
        assign(settings, "streaming", "false");
        assign(settings, "streaming", text);
        EXPECT_TRUE(settings.getBoolean("streaming")) << text;
    }
    for (const char* text : {"0", "false", "no", "No", "FALSE", "off"}) {
        assign(settings, "streaming", "true");
        assign(settings, "streaming", text);
        EXPECT_FALSE(settings.getBoolean("streaming")) << text;
    }
}

TEST(Assign, AcceptsAnySpellingOfAKey) {
    Settings settings;
    assign(settings, "Sample_Rate", "8001");
    EXPECT_EQ(settings.getInt("samplerate"), 8001);
    assign(settings, "SAMPLE-RATE", "8002");
    EXPECT_EQ(settings.getInt("samplerate"), 8002);
}

TEST(Assign, RefusesUnknownKeys) {
    EXPECT_EQ(refusal("colour", "red"), "there is no setting \"colour\"");
    EXPECT_EQ(refusal("", "red"), "there is no setting \"\"");
}

TEST(Assign, RefusesWhatIsNotWhollyAValueOfTheType) {
    EXPECT_EQ(refusal("streaming", "maybe"), "setting \"streaming\": \"maybe\" is not yes or no");
    for (const char* text : {"", "2", "yes please", "none", "truth"}) {
        EXPECT_NE(refusal("streaming", text), "") << text;
    }
    EXPECT_EQ(refusal("samplerate", "fast"), "setting \"samplerate\": \"fast\" is not an integer");
    for (const char* text : {"", "16k", "1.5", "0x", "9999999999", "-2147483649", "1 2"}) {
        EXPECT_NE(refusal("samplerate", text), "") << text;
    }
    EXPECT_EQ(refusal("lowerconfidence", "high"),
              "setting \"lowerconfidence\": \"high\" is not a number");
    for (const char* text : {"", "0.5x", "nan", "inf", "1e99", "0,5"}) {
        EXPECT_NE(refusal("lowerconfidence", text), "") << text;
    }
    EXPECT_EQ(refusal("My_LL", "here"),
              "setting \"myll\": \"here\" is not a position (latitude,longitude)");
    for (const char* text : {"", "1", "1,", ",1", "1,2,3", "1;2", "1,nan"}) {
        EXPECT_NE(refusal("myll", text), "") << text;
    }
}

TEST(BuildSettings, AppliesItsSourcesInOrder) {
    const ScratchDirectory directory;
    const LogCapture log;
    SettingsOptions options;
    options.defaults = {{"url", "default"}, {"uuid", "default"}, {"model", "d"}, {"vad", "d"}};
    options.file = directory.write("settings.xml",
                                   document("<uuid>file</uuid><model>file</model><vad>file</vad>"));
    options.assignments = {"model=set", "vad=set", "vad=set again=1"};
    options.explicitValues = {{"vad", "explicit"}};
    const boost::shared_ptr<Settings> settings = buildSettings(options);
    EXPECT_EQ(settings->getString("url"), "default");
    EXPECT_EQ(settings->getString("uuid"), "file");
    EXPECT_EQ(settings->getString("model"), "set");
    EXPECT_EQ(settings->getString("vad"), "explicit");
    EXPECT_EQ(settings->getString("language"), "ru-RU");
    EXPECT_TRUE(log.messages().empty());
}

TEST(BuildSettings, SplitsAnAssignmentAtItsFirstEqualsSign) {
    SettingsOptions options;
    options.assignments = {"vad=engine=wrtc;framems=20"};
    EXPECT_EQ(buildSettings(options)->getString("vad"), "engine=wrtc;framems=20");
}

TEST(BuildSettings, RefusesAnAssignmentWithoutAnEqualsSign) {
    SettingsOptions options;
    options.assignments = {"streaming"};
    try {
        buildSettings(options);
        FAIL();
    } catch (const Cli::UsageError& error) {
        EXPECT_STREQ(error.what(), "--set streaming: expected key=value");
    }
}

TEST(BuildSettings, LogsWhatIsWrongInADocumentAndAppliesTheRest) {
    const ScratchDirectory directory;
    const LogCapture log;
    SettingsOptions options;
    options.file = directory.write(
        "settings.xml",
        document("<colour>red</colour><Sample_Rate>0x1F40</Sample_Rate><streaming/>"));
    const boost::shared_ptr<Settings> settings = buildSettings(options);
    EXPECT_EQ(settings->getInt("samplerate"), 8000);
    EXPECT_TRUE(log.contains("updateFromXml: unknown element name colour, ignoring"));
    EXPECT_TRUE(log.contains("streaming: no body"));
}

TEST(BuildSettings, RepairsADocumentOnlyWhereAskedTo) {
    const ScratchDirectory directory;
    SettingsOptions options;
    options.defaults = {{"url", "http://127.0.0.1"}, {"uuid", std::string(32, 'a')}};
    options.file = directory.write(
        "settings.xml",
        document("<samplerate>96000</samplerate><speexquality>20</speexquality><vad>v</vad>"));
    options.assignments = {"speexquality=-1"};
    {
        const LogCapture log;
        const boost::shared_ptr<Settings> asWritten = buildSettings(options);
        EXPECT_EQ(asWritten->getInt("samplerate"), 96000);
        EXPECT_TRUE(log.messages().empty());
    }
    options.repairDocument = true;
    const LogCapture log;
    const boost::shared_ptr<Settings> repaired = buildSettings(options);
    EXPECT_EQ(repaired->getInt("samplerate"), 16000);
    EXPECT_EQ(repaired->getInt("speexquality"), -1);
    EXPECT_EQ(repaired->getString("vad"), "v");
    EXPECT_THAT(log.messages(),
                ::testing::ElementsAre(
                    "TalvoxSettings::validate: bad sampleRate: 96000, setting to default",
                    "TalvoxSettings::validate: bad speexQuality: 20, setting to default"));
}

std::string documentRefusal(const std::string& file) {
    SettingsOptions options;
    options.file = file;
    try {
        buildSettings(options);
    } catch (const Cli::UsageError& error) {
        return error.what();
    }
    return "";
}

TEST(BuildSettings, RefusesADocumentThatIsBrokenOrHoldsNoSettings) {
    const ScratchDirectory directory;
    const struct {
        std::string text;
        std::string reason;
    } cases[] = {
        {"", "it is not XML"},
        {"not XML at all", "it is not XML"},
        {"<startup>", "Error reading Element value. (line 1, column 10)"},
        {"<startup/>", "there is no element /startup/features/voice"},
        {"<\xC3", "the text is not UTF-8 (line 1, column 2)"},
        {document("<url>\xFF</url>"), "the text is not UTF-8 (line 1, column 32)"},
        {document("<url>http://h/?a&b</url>"),
         "an unknown entity loses its \"&\" (line 1, column 43)"},
        {document("<url>x</url>") + "more", "text outside of the elements (line 1, column 68)"},
    };
    for (const auto& each : cases) {
        const LogCapture log;
        const std::string file = directory.write("settings.xml", each.text);
        EXPECT_EQ(documentRefusal(file), "cannot use " + file + ": " + each.reason);
        EXPECT_TRUE(log.messages().empty()) << each.text;
    }
}

TEST(BuildSettings, LogsOnceHowADocumentIsRead) {
    const ScratchDirectory directory;
    SettingsOptions options;
    options.file = directory.write("settings.xml", "<?xml version='1.0' encoding='koi8-r'?>" +
                                                       document("<vad>\xFF</vad><speexquality/>"));
    const LogCapture log;
    EXPECT_EQ(buildSettings(options)->getString("vad"), "\xC3\xBF");
    EXPECT_THAT(log.messages(),
                ::testing::ElementsAre(
                    "XmlUtils: reading encoding koi8-r as ISO-8859-1", "speexquality: no body",
                    "updateFromXml: value of speexquality not a number: , keeping the "
                    "old value"));
}

TEST(BuildSettings, RefusesADocumentThatCannotBeRead) {
    const ScratchDirectory directory;
    SettingsOptions options;
    options.file = directory.path("nowhere.xml");
    try {
        buildSettings(options);
        FAIL();
    } catch (const Cli::UsageError& error) {
        EXPECT_EQ(std::string(error.what()),
                  "cannot read " + options.file + ": No such file or directory");
    }
    options.file = directory.path();
    EXPECT_THROW(buildSettings(options), Cli::UsageError);
    options.file = "/dev/zero";
    EXPECT_THROW(buildSettings(options), Cli::UsageError);
}

}  // namespace
