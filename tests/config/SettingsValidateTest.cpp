#include <gmock/gmock.h>

#include <limits>
#include <string>
#include <vector>

#include "support/LogCapture.h"
#include "talvox/Settings.h"

using Talvox::Settings;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::LogCapture;

namespace {

/** Settings that validation has nothing to say about. */
Settings goodSettings() {
    Settings settings;
    settings.putString(Settings::SKS_URL, "http://127.0.0.1:8090");
    settings.putString(Settings::SKS_UUID, "0123456789abcdef0123456789abcdef");
    return settings;
}

std::vector<std::string> linesOf(Settings& settings) {
    const LogCapture log;
    settings.validate();
    return log.messages();
}

struct TextRow {
    const std::string& key;
    std::vector<std::string> good;
    std::string replacement;
    std::string complaint;
    std::string settingTo;
};

/** Checks all admissible values, and that anything near them is replaced with the exact line. */
void checkRow(const TextRow& row) {
    for (const std::string& value : row.good) {
        Settings settings = goodSettings();
        settings.putString(row.key, value);
        EXPECT_THAT(linesOf(settings), IsEmpty()) << value;
        EXPECT_EQ(value, settings.getString(row.key));
    }
    std::string capital = row.good.front();
    capital[0] = static_cast<char>(capital[0] - 'a' + 'A');
    for (const std::string& value :
         {std::string(), std::string("on"), capital, row.good.front() + " ", std::string("%s%n")}) {
        Settings settings = goodSettings();
        settings.putString(row.key, value);
        EXPECT_THAT(linesOf(settings),
                    ElementsAre(row.complaint + ": " + value + ", setting to " + row.settingTo));
        EXPECT_EQ(row.replacement, settings.getString(row.key)) << value;
    }
}

int intAfter(const std::string& key, int value, const std::vector<std::string>& lines) {
    Settings settings = goodSettings();
    settings.putInt(key, value);
    EXPECT_EQ(lines, linesOf(settings)) << value;
    return settings.getInt(key);
}

struct Confidences {
    float upper;
    float winnerLead;
    float lower;
};

Confidences confidencesAfter(const Confidences& before, const std::vector<std::string>& lines) {
    Settings settings = goodSettings();
    settings.putFloat(Settings::SKS_UPPER_CONFIDENCE, before.upper);
    settings.putFloat(Settings::SKS_WINNER_LEAD_CONFIDENCE, before.winnerLead);
    settings.putFloat(Settings::SKS_LOWER_CONFIDENCE, before.lower);
    EXPECT_EQ(lines, linesOf(settings));
    return {settings.getFloat(Settings::SKS_UPPER_CONFIDENCE),
            settings.getFloat(Settings::SKS_WINNER_LEAD_CONFIDENCE),
            settings.getFloat(Settings::SKS_LOWER_CONFIDENCE)};
}

const std::string PREFIX = "TalvoxSettings::validate: bad ";

}  // namespace

TEST(SettingsValidate, FreshSettingsOnlyMissTheirAddressAndIdentifier) {
    Settings settings;
    EXPECT_THAT(linesOf(settings), ElementsAre("TalvoxSettings::validate: empty url",
                                               "TalvoxSettings::validate: bad uuid "));
    EXPECT_EQ(Settings().toXmlString("s"), settings.toXmlString("s"));
}

TEST(SettingsValidate, AnIdentifierOfAnotherLengthIsReportedAndStays) {
    for (const std::string& uuid : {std::string(31, 'a'), std::string(33, 'a'), std::string("x")}) {
        Settings settings = goodSettings();
        settings.putString(Settings::SKS_UUID, uuid);
        EXPECT_THAT(linesOf(settings), ElementsAre("TalvoxSettings::validate: bad uuid " + uuid));
        EXPECT_EQ(uuid, settings.getUuid());
    }
}

TEST(SettingsValidate, OnlyTheLengthOfAnIdentifierCounts) {
    Settings settings = goodSettings();
    settings.putString(Settings::SKS_UUID, std::string(32, '?'));
    EXPECT_THAT(linesOf(settings), IsEmpty());
}

TEST(SettingsValidate, RepairsTheMechanismOverride) {
    checkRow({Settings::SKS_ASR_POLICY_OVERRIDE,
              {"default", "korvel_only_if_enabled", "korvel_only_everywhere",
               "platform_only_if_enabled", "platform_only_everywhere", "platform_first_if_enabled",
               "platform_first_everywhere", "disabled"},
              "default",
              PREFIX + "asrPolicyOverride",
              "default"});
}

TEST(SettingsValidate, RepairsTheLoggingPolicy) {
    checkRow({Settings::SKS_LOGGING_POLICY,
              {"with_sound_always", "with_sound_if_wifi", "without_sound_always", "disabled"},
              "disabled",
              PREFIX + "loggingPolicy",
              "default"});
}

TEST(SettingsValidate, ABadEventLoggingPolicyEnablesEventLogging) {
    checkRow({Settings::SKS_EVENTS_LOGGING_POLICY,
              {"disabled", "enabled"},
              "enabled",
              PREFIX + "eventsLoggingPolicy",
              "default"});
}

TEST(SettingsValidate, RepairsTheSoundFormat) {
    checkRow({Settings::SKS_SOUND_FORMAT,
              {"speex", "pcm_if_wifi", "pcm"},
              "pcm_if_wifi",
              PREFIX + "soundFormat",
              "default"});
}

TEST(SettingsValidate, RepairsTheSessionMode) {
    checkRow({Settings::SKS_SESSION_MODE,
              {"general", "voice_recognition"},
              "voice_recognition",
              PREFIX + "sessionMode",
              "default"});
}

TEST(SettingsValidate, RepairsTheModel) {
    checkRow({Settings::RS_MODEL,
              {"general", "maps", "mapskvri", "ironlady"},
              "general",
              "RecognizerSettings::validate:: bad value for model",
              "general"});
}

TEST(SettingsValidate, RepairsTheApplicationsPolicy) {
    checkRow({Settings::RS_ASR_POLICY,
              {"disabled", "korvel_only", "platform_only", "platform_first"},
              "korvel_only",
              "RecognizerSettings::validate:: bad value for asrPolicy",
              "korvel_only"});
}

TEST(SettingsValidate, KeepsConfidencesOnTheirBounds) {
    for (const Confidences& good : {Confidences{1.0F, 0.0F, 0.0F}, Confidences{0.0F, 0.0F, 0.0F},
                                    Confidences{0.7F, 25.0F, 0.7F}}) {
        const Confidences after = confidencesAfter(good, {});
        EXPECT_EQ(good.upper, after.upper);
        EXPECT_EQ(good.winnerLead, after.winnerLead);
        EXPECT_EQ(good.lower, after.lower);
    }
}

TEST(SettingsValidate, ARepairedUpperConfidenceCountsForTheLowerOne) {
    const Confidences after = confidencesAfter(
        {1.5F, 0.2F, 0.95F}, {PREFIX + "upperConfidence: 1.500000, setting to default",
                              PREFIX + "lowerConfidence: 0.950000, setting to default"});
    EXPECT_EQ(0.9F, after.upper);
    EXPECT_EQ(0.4F, after.lower);
}

TEST(SettingsValidate, ANegativeUpperConfidenceBecomesTheDefault) {
    const Confidences after = confidencesAfter(
        {-0.25F, 0.2F, 0.4F}, {PREFIX + "upperConfidence: -0.250000, setting to default"});
    EXPECT_EQ(0.9F, after.upper);
    EXPECT_EQ(0.4F, after.lower);
}

TEST(SettingsValidate, ANegativeWinnerLeadBecomesTheDefaultBelowTheUpperConfidence) {
    const std::vector<std::string> lines{PREFIX +
                                         "winnerLeadConfidence: -1.000000, setting to default"};
    EXPECT_EQ(0.2F, confidencesAfter({0.9F, -1.0F, 0.1F}, lines).winnerLead);
    EXPECT_EQ(0.0F, confidencesAfter({0.2F, -1.0F, 0.1F}, lines).winnerLead);
    EXPECT_EQ(0.0F, confidencesAfter({0.1F, -1.0F, 0.1F}, lines).winnerLead);
}

TEST(SettingsValidate, ABadLowerConfidenceBecomesTheDefaultBelowTheUpperConfidence) {
    EXPECT_EQ(0.0F, confidencesAfter({0.1F, 0.0F, 0.3F},
                                     {PREFIX + "lowerConfidence: 0.300000, setting to default"})
                        .lower);
    const std::vector<std::string> negative{PREFIX +
                                            "lowerConfidence: -0.500000, setting to default"};
    EXPECT_EQ(0.4F, confidencesAfter({0.9F, 0.0F, -0.5F}, negative).lower);
    EXPECT_EQ(0.0F, confidencesAfter({0.4F, 0.0F, -0.5F}, negative).lower);
}

TEST(SettingsValidate, ConfidencesThatAreNotNumbersBecomeTheDefaults) {
    const float nan = std::numeric_limits<float>::quiet_NaN();
    Settings settings = goodSettings();
    settings.putFloat(Settings::SKS_UPPER_CONFIDENCE, nan);
    settings.putFloat(Settings::SKS_WINNER_LEAD_CONFIDENCE, nan);
    settings.putFloat(Settings::SKS_LOWER_CONFIDENCE, nan);
    EXPECT_EQ(3U, linesOf(settings).size());
    EXPECT_EQ(0.9F, settings.getFloat(Settings::SKS_UPPER_CONFIDENCE));
    EXPECT_EQ(0.2F, settings.getFloat(Settings::SKS_WINNER_LEAD_CONFIDENCE));
    EXPECT_EQ(0.4F, settings.getFloat(Settings::SKS_LOWER_CONFIDENCE));
}

TEST(SettingsValidate, KeepsEverySampleRateInTheRange) {
    for (const int rate : {8000, 8001, 11025, 16000, 44099, 44100}) {
        EXPECT_EQ(rate, intAfter(Settings::SKS_SAMPLE_RATE, rate, {}));
    }
}

TEST(SettingsValidate, ASampleRateOutsideTheRangeBecomesTheDefault) {
    for (const int rate : {7999, 44101, 0, -16000, std::numeric_limits<int>::max(),
                           std::numeric_limits<int>::min()}) {
        EXPECT_EQ(16000, intAfter(Settings::SKS_SAMPLE_RATE, rate,
                                  {PREFIX + "sampleRate: " + std::to_string(rate) +
                                   ", setting to default"}));
    }
}

TEST(SettingsValidate, ASpeexQualityOutsideTheRangeBecomesItsNearerEnd) {
    EXPECT_EQ(0, intAfter(Settings::SKS_SPEEX_QUALITY, 0, {}));
    EXPECT_EQ(10, intAfter(Settings::SKS_SPEEX_QUALITY, 10, {}));
    EXPECT_EQ(10, intAfter(Settings::SKS_SPEEX_QUALITY, 11,
                           {PREFIX + "speexQuality: 11, setting to default"}));
    EXPECT_EQ(0, intAfter(Settings::SKS_SPEEX_QUALITY, -3,
                          {PREFIX + "speexQuality: -3, setting to default"}));
}

TEST(SettingsValidate, AVerbosityOutsideTheRangeBecomesZero) {
    EXPECT_EQ(10, intAfter(Settings::SKS_VERBOSE_LEVEL, 10, {}));
    EXPECT_EQ(0, intAfter(Settings::SKS_VERBOSE_LEVEL, -1,
                          {PREFIX + "verboseLevel: -1, setting to default"}));
    EXPECT_EQ(0, intAfter(Settings::SKS_VERBOSE_LEVEL, 11,
                          {PREFIX + "verboseLevel: 11, setting to default"}));
}

TEST(SettingsValidate, ChecksInAFixedOrder) {
    Settings settings;
    for (const std::string& key :
         {Settings::SKS_ASR_POLICY_OVERRIDE, Settings::SKS_LOGGING_POLICY,
          Settings::SKS_EVENTS_LOGGING_POLICY, Settings::SKS_SOUND_FORMAT,
          Settings::SKS_SESSION_MODE, Settings::RS_MODEL, Settings::RS_ASR_POLICY}) {
        settings.putString(key, "x");
    }
    settings.putFloat(Settings::SKS_UPPER_CONFIDENCE, -1.0F);
    settings.putFloat(Settings::SKS_WINNER_LEAD_CONFIDENCE, -1.0F);
    settings.putFloat(Settings::SKS_LOWER_CONFIDENCE, -1.0F);
    settings.putInt(Settings::SKS_SAMPLE_RATE, -1);
    settings.putInt(Settings::SKS_SPEEX_QUALITY, -1);
    settings.putInt(Settings::SKS_VERBOSE_LEVEL, -1);
    EXPECT_THAT(
        linesOf(settings),
        ElementsAre("TalvoxSettings::validate: empty url", "TalvoxSettings::validate: bad uuid ",
                    "TalvoxSettings::validate: bad asrPolicyOverride: x, setting to default",
                    "TalvoxSettings::validate: bad loggingPolicy: x, setting to default",
                    "TalvoxSettings::validate: bad eventsLoggingPolicy: x, setting to default",
                    "TalvoxSettings::validate: bad soundFormat: x, setting to default",
                    "TalvoxSettings::validate: bad sessionMode: x, setting to default",
                    "TalvoxSettings::validate: bad upperConfidence: -1.000000, setting to default",
                    "TalvoxSettings::validate: bad winnerLeadConfidence: -1.000000, setting to "
                    "default",
                    "TalvoxSettings::validate: bad lowerConfidence: -1.000000, setting to default",
                    "TalvoxSettings::validate: bad sampleRate: -1, setting to default",
                    "TalvoxSettings::validate: bad speexQuality: -1, setting to default",
                    "TalvoxSettings::validate: bad verboseLevel: -1, setting to default",
                    "RecognizerSettings::validate:: bad value for model: x, setting to general",
                    "RecognizerSettings::validate:: bad value for asrPolicy: x, setting to "
                    "korvel_only"));
}

TEST(SettingsValidate, LeavesTheRestAlone) {
    Settings settings = goodSettings();
    settings.putBoolean(Settings::SKS_STREAMING, true);
    settings.putString(Settings::SKS_VAD_SETTINGS, "engine=nonsense");
    settings.putString(Settings::RS_LANGUAGE, "");
    settings.putLatLon(Settings::RS_MY_LL, {1000.0F, -1000.0F});
    settings.putLatLon(Settings::RS_CENTER_LL, {-1000.0F, 1000.0F});
    settings.putString(Settings::RS_SESSION_ID, "a\r\nb");
    const std::string before = settings.toXmlString("s");
    EXPECT_THAT(linesOf(settings), IsEmpty());
    EXPECT_EQ(before, settings.toXmlString("s"));
}
