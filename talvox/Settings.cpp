#include "talvox/Settings.h"

#include <algorithm>
#include <boost/make_shared.hpp>

#include "pal/kd_assert.h"
#include "pal/kd_log.h"
#include "talvox/impl/SettingsCheck.h"

namespace Talvox {

namespace {

constexpr int SAMPLE_RATE_DFLT = 16000;
constexpr int SAMPLE_RATE_MIN = 8000;
constexpr int SAMPLE_RATE_MAX = 44100;
constexpr float UPPER_CONFIDENCE_DFLT = 0.9F;
constexpr float WINNER_LEAD_CONFIDENCE_DFLT = 0.2F;
constexpr float LOWER_CONFIDENCE_DFLT = 0.4F;
constexpr int SPEEX_QUALITY_DFLT = 8;
constexpr int SPEEX_QUALITY_MAX = 10;
constexpr int VERBOSE_LEVEL_DFLT = 0;
constexpr int VERBOSE_LEVEL_MAX = 10;
const char* const LANGUAGE_DFLT = "ru-RU";
constexpr unsigned UUID_LENGTH = 32;

/** The default if the upper threshold leaves room for it. */
float defaultBelow(float upper, float dflt) {
    return upper > dflt ? dflt : 0.0F;
}

}  // namespace

void requireConformance(const Settings& settings) {
    KOR_ASSERT_AT(settings.conformsTo(Settings::bundleSpecs), "conformsTo(bundleSpecs)",
                  "talvox/Talvox", __LINE__);
}

Settings::Settings() {
    putString(SKS_URL, "");
    putString(SKS_UUID, "");
    putString(SKS_ASR_POLICY_OVERRIDE, ASRO_DEFAULT);
    putString(SKS_LOGGING_POLICY, LOG_DISABLED);
    putString(SKS_EVENTS_LOGGING_POLICY, EVENTS_LOG_DISABLED);
    putString(SKS_SOUND_FORMAT, SOUND_FORMAT_PCM_IF_WIFI);
    putInt(SKS_SAMPLE_RATE, SAMPLE_RATE_DFLT);
    putString(SKS_VAD_SETTINGS, "");
    putString(SKS_SESSION_MODE, SESSION_MODE_VOICE_RECOGNITION);
    putBoolean(SKS_STREAMING, false);
    putFloat(SKS_UPPER_CONFIDENCE, UPPER_CONFIDENCE_DFLT);
    putFloat(SKS_WINNER_LEAD_CONFIDENCE, WINNER_LEAD_CONFIDENCE_DFLT);
    putFloat(SKS_LOWER_CONFIDENCE, LOWER_CONFIDENCE_DFLT);
    putInt(SKS_SPEEX_QUALITY, SPEEX_QUALITY_DFLT);
    putInt(SKS_VERBOSE_LEVEL, VERBOSE_LEVEL_DFLT);
    putString(RS_LANGUAGE, LANGUAGE_DFLT);
    putString(RS_MODEL, MODEL_GENERAL);
    putString(RS_ASR_POLICY, ASRP_KORVEL_ONLY);
    putLatLon(RS_MY_LL, LatLon());
    putLatLon(RS_CENTER_LL, LatLon());
    putString(RS_SESSION_ID, "");
    requireConformance(*this);
}

Settings::~Settings() = default;

boost::shared_ptr<Settings> Settings::clone() const {
    return boost::make_shared<Settings>(*this);
}

const std::string& Settings::getUrl() const {
    return getString(SKS_URL);
}

const std::string& Settings::getUuid() const {
    return getString(SKS_UUID);
}

const std::string& Settings::getLanguage() const {
    return getString(RS_LANGUAGE);
}

const std::string& Settings::getModel() const {
    return getString(RS_MODEL);
}

const std::string& Settings::getSessionId() const {
    return getString(RS_SESSION_ID);
}

int Settings::getSampleRate() const {
    return getInt(SKS_SAMPLE_RATE);
}

void Settings::validate() {
    validateEngineTexts();
    validateConfidences();
    validateNumbers();
    validateRecognizerTexts();
}

void Settings::validateEngineTexts() {
    if (getUrl().empty()) {
        kdLogFormatMessage("TalvoxSettings::validate: empty url");
    }
    if (getUuid().size() != UUID_LENGTH) {
        kdLogFormatMessage("TalvoxSettings::validate: bad uuid %s", getUuid().c_str());
    }
    repairText(SKS_ASR_POLICY_OVERRIDE,
               {&ASRO_DEFAULT, &ASRO_KORVEL_ONLY_IF_ENABLED, &ASRO_KORVEL_ONLY_EVERYWHERE,
                &ASRO_PLATFORM_ONLY_IF_ENABLED, &ASRO_PLATFORM_ONLY_EVERYWHERE,
                &ASRO_PLATFORM_FIRST_IF_ENABLED, &ASRO_PLATFORM_FIRST_EVERYWHERE, &ASRO_DISABLED},
               ASRO_DEFAULT, "TalvoxSettings::validate: bad asrPolicyOverride", "default");
    repairText(
        SKS_LOGGING_POLICY,
        {&LOG_WITH_SOUND_ALWAYS, &LOG_WITH_SOUND_IF_WIFI, &LOG_WITHOUT_SOUND_ALWAYS, &LOG_DISABLED},
        LOG_DISABLED, "TalvoxSettings::validate: bad loggingPolicy", "default");
    // The replacement is not the constructor's default, on purpose.
    repairText(SKS_EVENTS_LOGGING_POLICY, {&EVENTS_LOG_DISABLED, &EVENTS_LOG_ENABLED},
               EVENTS_LOG_ENABLED, "TalvoxSettings::validate: bad eventsLoggingPolicy", "default");
    repairText(SKS_SOUND_FORMAT,
               {&SOUND_FORMAT_SPEEX, &SOUND_FORMAT_PCM_IF_WIFI, &SOUND_FORMAT_PCM},
               SOUND_FORMAT_PCM_IF_WIFI, "TalvoxSettings::validate: bad soundFormat", "default");
    repairText(SKS_SESSION_MODE, {&SESSION_MODE_GENERAL, &SESSION_MODE_VOICE_RECOGNITION},
               SESSION_MODE_VOICE_RECOGNITION, "TalvoxSettings::validate: bad sessionMode",
               "default");
}

void Settings::validateConfidences() {
    // Written so that a value that is not a number is bad.
    float upper = getFloat(SKS_UPPER_CONFIDENCE);
    if (!(upper >= 0.0F && upper <= 1.0F)) {
        kdLogFormatMessage("TalvoxSettings::validate: bad upperConfidence: %f, setting to default",
                           static_cast<double>(upper));
        upper = UPPER_CONFIDENCE_DFLT;
        putFloat(SKS_UPPER_CONFIDENCE, upper);
    }
    const float winnerLead = getFloat(SKS_WINNER_LEAD_CONFIDENCE);
    if (!(winnerLead >= 0.0F)) {
        kdLogFormatMessage(
            "TalvoxSettings::validate: bad winnerLeadConfidence: %f, setting to default",
            static_cast<double>(winnerLead));
        putFloat(SKS_WINNER_LEAD_CONFIDENCE, defaultBelow(upper, WINNER_LEAD_CONFIDENCE_DFLT));
    }
    const float lower = getFloat(SKS_LOWER_CONFIDENCE);
    if (!(lower >= 0.0F && lower <= upper)) {
        kdLogFormatMessage("TalvoxSettings::validate: bad lowerConfidence: %f, setting to default",
                           static_cast<double>(lower));
        putFloat(SKS_LOWER_CONFIDENCE, defaultBelow(upper, LOWER_CONFIDENCE_DFLT));
    }
}

void Settings::validateNumbers() {
    const int sampleRate = getSampleRate();
    if (sampleRate < SAMPLE_RATE_MIN || sampleRate > SAMPLE_RATE_MAX) {
        kdLogFormatMessage("TalvoxSettings::validate: bad sampleRate: %d, setting to default",
                           sampleRate);
        putInt(SKS_SAMPLE_RATE, SAMPLE_RATE_DFLT);
    }
    const int speexQuality = getInt(SKS_SPEEX_QUALITY);
    if (speexQuality < 0 || speexQuality > SPEEX_QUALITY_MAX) {
        kdLogFormatMessage("TalvoxSettings::validate: bad speexQuality: %d, setting to default",
                           speexQuality);
        // The nearer end, not the default.
        putInt(SKS_SPEEX_QUALITY, speexQuality < 0 ? 0 : SPEEX_QUALITY_MAX);
    }
    const int verboseLevel = getInt(SKS_VERBOSE_LEVEL);
    if (verboseLevel < 0 || verboseLevel > VERBOSE_LEVEL_MAX) {
        kdLogFormatMessage("TalvoxSettings::validate: bad verboseLevel: %d, setting to default",
                           verboseLevel);
        putInt(SKS_VERBOSE_LEVEL, VERBOSE_LEVEL_DFLT);
    }
}

void Settings::validateRecognizerTexts() {
    repairText(RS_MODEL, {&MODEL_GENERAL, &MODEL_MAPS, &MODEL_MAPSKVRI, &MODEL_IRONLADY},
               MODEL_GENERAL, "RecognizerSettings::validate:: bad value for model", "general");
    repairText(RS_ASR_POLICY,
               {&ASRP_DISABLED, &ASRP_KORVEL_ONLY, &ASRP_PLATFORM_ONLY, &ASRP_PLATFORM_FIRST},
               ASRP_KORVEL_ONLY, "RecognizerSettings::validate:: bad value for asrPolicy",
               "korvel_only");
}

void Settings::repairText(const std::string& key, const TextList& admissible,
                          const std::string& replacement, const char* complaint,
                          const char* settingTo) {
    const std::string& value = getString(key);
    const bool isAdmissible =
        std::any_of(admissible.begin(), admissible.end(),
                    [&value](const std::string* text) { return value == *text; });
    if (!isAdmissible) {
        kdLogFormatMessage("%s: %s, setting to %s", complaint, value.c_str(), settingTo);
        putString(key, replacement);
    }
}

}  // namespace Talvox
