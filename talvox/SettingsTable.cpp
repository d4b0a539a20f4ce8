#include "talvox/SettingsTable.h"

#include <limits>

#include "talvox/impl/EarlyInit.h"

namespace Talvox {

TALVOX_EARLY const std::string Settings::ASRO_DEFAULT("default");
TALVOX_EARLY const std::string Settings::ASRO_KORVEL_ONLY_IF_ENABLED("korvel_only_if_enabled");
TALVOX_EARLY const std::string Settings::ASRO_KORVEL_ONLY_EVERYWHERE("korvel_only_everywhere");
TALVOX_EARLY const std::string Settings::ASRO_PLATFORM_ONLY_IF_ENABLED("platform_only_if_enabled");
TALVOX_EARLY const std::string Settings::ASRO_PLATFORM_ONLY_EVERYWHERE("platform_only_everywhere");
TALVOX_EARLY const std::string Settings::ASRO_PLATFORM_FIRST_IF_ENABLED(
    "platform_first_if_enabled");
TALVOX_EARLY const std::string Settings::ASRO_PLATFORM_FIRST_EVERYWHERE(
    "platform_first_everywhere");
TALVOX_EARLY const std::string Settings::ASRO_DISABLED("disabled");

TALVOX_EARLY const std::string Settings::LOG_WITH_SOUND_ALWAYS("with_sound_always");
TALVOX_EARLY const std::string Settings::LOG_WITH_SOUND_IF_WIFI("with_sound_if_wifi");
TALVOX_EARLY const std::string Settings::LOG_WITHOUT_SOUND_ALWAYS("without_sound_always");
TALVOX_EARLY const std::string Settings::LOG_DISABLED("disabled");

TALVOX_EARLY const std::string Settings::EVENTS_LOG_ENABLED("enabled");
TALVOX_EARLY const std::string Settings::EVENTS_LOG_DISABLED("disabled");

TALVOX_EARLY const std::string Settings::SOUND_FORMAT_PCM("pcm");
TALVOX_EARLY const std::string Settings::SOUND_FORMAT_PCM_IF_WIFI("pcm_if_wifi");
TALVOX_EARLY const std::string Settings::SOUND_FORMAT_SPEEX("speex");

TALVOX_EARLY const std::string Settings::SESSION_MODE_GENERAL("general");
TALVOX_EARLY const std::string Settings::SESSION_MODE_VOICE_RECOGNITION("voice_recognition");

TALVOX_EARLY const std::string Settings::MODEL_GENERAL("general");
TALVOX_EARLY const std::string Settings::MODEL_MAPS("maps");
TALVOX_EARLY const std::string Settings::MODEL_MAPSKVRI("mapskvri");
TALVOX_EARLY const std::string Settings::MODEL_IRONLADY("ironlady");

TALVOX_EARLY const std::string Settings::ASRP_KORVEL_ONLY("korvel_only");
TALVOX_EARLY const std::string Settings::ASRP_PLATFORM_ONLY("platform_only");
TALVOX_EARLY const std::string Settings::ASRP_PLATFORM_FIRST("platform_first");
TALVOX_EARLY const std::string Settings::ASRP_DISABLED("disabled");

TALVOX_EARLY const std::string Settings::XML_PATH_DFLT("/startup/features/voice");

namespace {

TALVOX_EARLY const std::string EMPTY;
TALVOX_EARLY const std::string LANGUAGE_DFLT("ru-RU");

constexpr SettingRule unchecked() {
    return {};
}

constexpr SettingRule reported(SettingRule::Kind kind, const char* complaint) {
    SettingRule rule;
    rule.kind = kind;
    rule.complaint = complaint;
    return rule;
}

template <typename... Texts>
constexpr SettingRule oneOf(SettingRule::Turn turn, const char* complaint, const char* settingTo,
                            const std::string* replacement, const Texts*... values) {
    static_assert(sizeof...(values) <= SettingRule::VALUES_MAX, "the list has an end");
    SettingRule rule = {SettingRule::ONE_OF, SettingRule::TO_REPLACEMENT, turn, 0, 0, false,
                        {values...}};
    rule.replacement = replacement;
    rule.complaint = complaint;
    rule.settingTo = settingTo;
    return rule;
}

constexpr SettingRule range(SettingRule::Turn turn, const char* complaint, double lowest,
                            double highest, SettingRule::Repair repair) {
    SettingRule rule = {SettingRule::RANGE, repair, turn, lowest, highest};
    rule.complaint = complaint;
    return rule;
}

constexpr SettingRule upToUpperConfidence(SettingRule rule) {
    rule.isUpToUpperConfidence = true;
    return rule;
}

}  // namespace

#define SETTING(constant, key, ...) TALVOX_EARLY const std::string Settings::constant(key);
#include "talvox/impl/SettingRows.inc"
#undef SETTING

// The compiler makes the tables, so static initialisers may use them.

#define SETTING(constant, key, type, ...) {key, Util::Bundle::type, nullptr},
const Util::Bundle::ElemSpec Settings::bundleSpecs[] = {
#include "talvox/impl/SettingRows.inc"
    {nullptr, BOOLEAN, nullptr}};
#undef SETTING

#define SETTING(constant, key, type, level, ...) {key, Level::level},
const Settings::KeyLevel Settings::keyLevels[] = {
#include "talvox/impl/SettingRows.inc"
    {nullptr, Level::BOTH}};
#undef SETTING

#define SETTING(constant, key, type, level, textDefault, numberDefault, rule, java, unit, effect) \
    {#constant,                                                                                   \
     key,                                                                                         \
     Util::Bundle::type,                                                                          \
     Settings::Level::level,                                                                      \
     textDefault,                                                                                 \
     numberDefault,                                                                               \
     rule,                                                                                        \
     java,                                                                                        \
     unit,                                                                                        \
     effect},
const SettingRow SettingsTable::rows[] = {
#include "talvox/impl/SettingRows.inc"
    {nullptr, nullptr, Util::Bundle::BOOLEAN, Settings::Level::BOTH, nullptr, 0, unchecked(),
     nullptr, nullptr, nullptr}};
#undef SETTING

const SettingRow* SettingsTable::find(const std::string& key) {
    const std::string normalised = Util::Bundle::normalizeKey(key);
    for (const SettingRow* row = rows; row->key != nullptr; ++row) {
        if (normalised == row->key) {
            return row;
        }
    }
    return nullptr;
}

}  // namespace Talvox
