#include "talvox/Settings.h"

#include <gmock/gmock.h>

#include <boost/make_shared.hpp>

#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "talvox/impl/SettingsCheck.h"

using Talvox::Settings;
using ::testing::IsEmpty;
using TestSupport::AssertCapture;
using Util::Bundle;

namespace {

/** What the settings look like to an initialiser that runs before most others. */
struct EarlyUser {
    EarlyUser() : conforms(settings.conformsTo(Settings::bundleSpecs)), key(Settings::RS_MODEL) {}
    Settings settings;
    bool conforms;
    std::string key;
};
__attribute__((init_priority(200))) const EarlyUser EARLY_USER;

}  // namespace

TEST(Settings, MayBeUsedByStaticInitialisers) {
    EXPECT_TRUE(EARLY_USER.conforms);
    EXPECT_EQ("model", EARLY_USER.key);
    EXPECT_EQ("korvel_only", EARLY_USER.settings.getString("asrpolicy"));
}

TEST(Settings, AFreshObjectConformsToTheTable) {
    const AssertCapture asserts;
    const Settings settings;
    EXPECT_TRUE(settings.conformsTo(Settings::bundleSpecs));
    EXPECT_THAT(asserts.reports(), IsEmpty());
}

TEST(Settings, AnObjectThatDoesNotConformIsReportedAndStaysAsItIs) {
    Settings settings;
    settings.putInt("one more", 7);
    settings.putString(Settings::SKS_SAMPLE_RATE, "fast");
    const AssertCapture asserts;
    Talvox::requireConformance(settings);
    ASSERT_EQ(1U, asserts.count());
    EXPECT_EQ("conformsTo(bundleSpecs)", asserts.reports()[0].condition);
    EXPECT_EQ("talvox/Talvox", asserts.reports()[0].path);
    EXPECT_EQ(7, settings.getInt("one more"));
    EXPECT_EQ("fast", settings.getString(Settings::SKS_SAMPLE_RATE));
    EXPECT_EQ(1U, asserts.count());
}

TEST(Settings, KeysHaveTheirTexts) {
    EXPECT_EQ("url", Settings::SKS_URL);
    EXPECT_EQ("uuid", Settings::SKS_UUID);
    EXPECT_EQ("asr", Settings::SKS_ASR_POLICY_OVERRIDE);
    EXPECT_EQ("logging", Settings::SKS_LOGGING_POLICY);
    EXPECT_EQ("eventslogging", Settings::SKS_EVENTS_LOGGING_POLICY);
    EXPECT_EQ("soundformat", Settings::SKS_SOUND_FORMAT);
    EXPECT_EQ("samplerate", Settings::SKS_SAMPLE_RATE);
    EXPECT_EQ("vad", Settings::SKS_VAD_SETTINGS);
    EXPECT_EQ("sessionmode", Settings::SKS_SESSION_MODE);
    EXPECT_EQ("streaming", Settings::SKS_STREAMING);
    EXPECT_EQ("upperconfidence", Settings::SKS_UPPER_CONFIDENCE);
    EXPECT_EQ("winnerleadconfidence", Settings::SKS_WINNER_LEAD_CONFIDENCE);
    EXPECT_EQ("lowerconfidence", Settings::SKS_LOWER_CONFIDENCE);
    EXPECT_EQ("speexquality", Settings::SKS_SPEEX_QUALITY);
    EXPECT_EQ("verbosity", Settings::SKS_VERBOSE_LEVEL);
    EXPECT_EQ("language", Settings::RS_LANGUAGE);
    EXPECT_EQ("model", Settings::RS_MODEL);
    EXPECT_EQ("asrpolicy", Settings::RS_ASR_POLICY);
    EXPECT_EQ("myll", Settings::RS_MY_LL);
    EXPECT_EQ("centerll", Settings::RS_CENTER_LL);
    EXPECT_EQ("sessionid", Settings::RS_SESSION_ID);
}

TEST(Settings, ValuesHaveTheirTexts) {
    EXPECT_EQ("default", Settings::ASRO_DEFAULT);
    EXPECT_EQ("korvel_only_if_enabled", Settings::ASRO_KORVEL_ONLY_IF_ENABLED);
    EXPECT_EQ("korvel_only_everywhere", Settings::ASRO_KORVEL_ONLY_EVERYWHERE);
    EXPECT_EQ("platform_only_if_enabled", Settings::ASRO_PLATFORM_ONLY_IF_ENABLED);
    EXPECT_EQ("platform_only_everywhere", Settings::ASRO_PLATFORM_ONLY_EVERYWHERE);
    EXPECT_EQ("platform_first_if_enabled", Settings::ASRO_PLATFORM_FIRST_IF_ENABLED);
    EXPECT_EQ("platform_first_everywhere", Settings::ASRO_PLATFORM_FIRST_EVERYWHERE);
    EXPECT_EQ("disabled", Settings::ASRO_DISABLED);
    EXPECT_EQ("with_sound_always", Settings::LOG_WITH_SOUND_ALWAYS);
    EXPECT_EQ("with_sound_if_wifi", Settings::LOG_WITH_SOUND_IF_WIFI);
    EXPECT_EQ("without_sound_always", Settings::LOG_WITHOUT_SOUND_ALWAYS);
    EXPECT_EQ("disabled", Settings::LOG_DISABLED);
    EXPECT_EQ("enabled", Settings::EVENTS_LOG_ENABLED);
    EXPECT_EQ("disabled", Settings::EVENTS_LOG_DISABLED);
    EXPECT_EQ("pcm", Settings::SOUND_FORMAT_PCM);
    EXPECT_EQ("pcm_if_wifi", Settings::SOUND_FORMAT_PCM_IF_WIFI);
    EXPECT_EQ("speex", Settings::SOUND_FORMAT_SPEEX);
    EXPECT_EQ("general", Settings::SESSION_MODE_GENERAL);
    EXPECT_EQ("voice_recognition", Settings::SESSION_MODE_VOICE_RECOGNITION);
    EXPECT_EQ("general", Settings::MODEL_GENERAL);
    EXPECT_EQ("maps", Settings::MODEL_MAPS);
    EXPECT_EQ("mapskvri", Settings::MODEL_MAPSKVRI);
    EXPECT_EQ("ironlady", Settings::MODEL_IRONLADY);
    EXPECT_EQ("korvel_only", Settings::ASRP_KORVEL_ONLY);
    EXPECT_EQ("platform_only", Settings::ASRP_PLATFORM_ONLY);
    EXPECT_EQ("platform_first", Settings::ASRP_PLATFORM_FIRST);
    EXPECT_EQ("disabled", Settings::ASRP_DISABLED);
    EXPECT_EQ("/startup/features/voice", Settings::XML_PATH_DFLT);
}

TEST(Settings, DefaultsAreThese) {
    const Settings settings;
    EXPECT_EQ(
        "<s>\n"
        "<asr>default</asr>\n"
        "<asrpolicy>korvel_only</asrpolicy>\n"
        "<centerll>0,0</centerll>\n"
        "<eventslogging>disabled</eventslogging>\n"
        "<language>ru-RU</language>\n"
        "<logging>disabled</logging>\n"
        "<lowerconfidence>0.4</lowerconfidence>\n"
        "<model>general</model>\n"
        "<myll>0,0</myll>\n"
        "<samplerate>16000</samplerate>\n"
        "<sessionid></sessionid>\n"
        "<sessionmode>voice_recognition</sessionmode>\n"
        "<soundformat>pcm_if_wifi</soundformat>\n"
        "<speexquality>8</speexquality>\n"
        "<streaming>false</streaming>\n"
        "<upperconfidence>0.9</upperconfidence>\n"
        "<url></url>\n"
        "<uuid></uuid>\n"
        "<vad></vad>\n"
        "<verbosity>0</verbosity>\n"
        "<winnerleadconfidence>0.2</winnerleadconfidence>\n"
        "</s>\n",
        settings.toXmlString("s"));
}

TEST(Settings, TheTableHasTheseRowsInThisOrder) {
    const struct {
        std::string name;
        Bundle::ElemType type;
    } rows[] = {{"url", Bundle::STRING},
                {"uuid", Bundle::STRING},
                {"asr", Bundle::STRING},
                {"logging", Bundle::STRING},
                {"eventslogging", Bundle::STRING},
                {"soundformat", Bundle::STRING},
                {"streaming", Bundle::BOOLEAN},
                {"samplerate", Bundle::INT},
                {"vad", Bundle::STRING},
                {"sessionmode", Bundle::STRING},
                {"upperconfidence", Bundle::FLOAT},
                {"winnerleadconfidence", Bundle::FLOAT},
                {"lowerconfidence", Bundle::FLOAT},
                {"speexquality", Bundle::INT},
                {"verbosity", Bundle::INT},
                {"language", Bundle::STRING},
                {"model", Bundle::STRING},
                {"asrpolicy", Bundle::STRING},
                {"myll", Bundle::LATLON},
                {"centerll", Bundle::LATLON},
                {"sessionid", Bundle::STRING}};
    const Bundle::ElemSpec* row = Settings::bundleSpecs;
    for (const auto& expected : rows) {
        ASSERT_NE(nullptr, row->name);
        EXPECT_EQ(expected.name, row->name);
        EXPECT_EQ(expected.type, row->type);
        EXPECT_EQ(nullptr, row->subSpec);
        ++row;
    }
    EXPECT_EQ(nullptr, row->name);
}

TEST(Settings, AnExtraKeyDoesNotConform) {
    Settings settings;
    settings.putInt("colour", 1);
    EXPECT_FALSE(settings.conformsTo(Settings::bundleSpecs));
}

TEST(Settings, GettersReadTheirKeys) {
    Settings settings;
    settings.putString(Settings::SKS_URL, "http://127.0.0.1");
    settings.putString(Settings::SKS_UUID, "uuid");
    settings.putString(Settings::RS_LANGUAGE, "tr-TR");
    settings.putString(Settings::RS_MODEL, "maps");
    settings.putString(Settings::RS_SESSION_ID, "session");
    settings.putInt(Settings::SKS_SAMPLE_RATE, 8000);
    EXPECT_EQ("http://127.0.0.1", settings.getUrl());
    EXPECT_EQ("uuid", settings.getUuid());
    EXPECT_EQ("tr-TR", settings.getLanguage());
    EXPECT_EQ("maps", settings.getModel());
    EXPECT_EQ("session", settings.getSessionId());
    EXPECT_EQ(8000, settings.getSampleRate());
}

TEST(Settings, ACloneIsIndependent) {
    const Settings settings;
    const boost::shared_ptr<Settings> copy = settings.clone();
    copy->putInt(Settings::SKS_SAMPLE_RATE, 8000);
    EXPECT_EQ(16000, settings.getSampleRate());
    EXPECT_TRUE(copy->conformsTo(Settings::bundleSpecs));
}
