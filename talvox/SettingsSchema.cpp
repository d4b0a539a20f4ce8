#include "talvox/Settings.h"
#include "talvox/impl/EarlyInit.h"

namespace Talvox {

namespace {

// The table is made by the compiler, so it needs the keys as plain text.
constexpr char KEY_URL[] = "url";
constexpr char KEY_UUID[] = "uuid";
constexpr char KEY_ASR_POLICY_OVERRIDE[] = "asr";
constexpr char KEY_LOGGING_POLICY[] = "logging";
constexpr char KEY_EVENTS_LOGGING_POLICY[] = "eventslogging";
constexpr char KEY_SOUND_FORMAT[] = "soundformat";
constexpr char KEY_SAMPLE_RATE[] = "samplerate";
constexpr char KEY_VAD_SETTINGS[] = "vad";
constexpr char KEY_SESSION_MODE[] = "sessionmode";
constexpr char KEY_STREAMING[] = "streaming";
constexpr char KEY_UPPER_CONFIDENCE[] = "upperconfidence";
constexpr char KEY_WINNER_LEAD_CONFIDENCE[] = "winnerleadconfidence";
constexpr char KEY_LOWER_CONFIDENCE[] = "lowerconfidence";
constexpr char KEY_SPEEX_QUALITY[] = "speexquality";
constexpr char KEY_VERBOSE_LEVEL[] = "verbosity";
constexpr char KEY_LANGUAGE[] = "language";
constexpr char KEY_MODEL[] = "model";
constexpr char KEY_ASR_POLICY[] = "asrpolicy";
constexpr char KEY_MY_LL[] = "myll";
constexpr char KEY_CENTER_LL[] = "centerll";
constexpr char KEY_SESSION_ID[] = "sessionid";

}  // namespace

TALVOX_EARLY const std::string Settings::SKS_URL(KEY_URL);
TALVOX_EARLY const std::string Settings::SKS_UUID(KEY_UUID);
TALVOX_EARLY const std::string Settings::SKS_ASR_POLICY_OVERRIDE(KEY_ASR_POLICY_OVERRIDE);
TALVOX_EARLY const std::string Settings::SKS_LOGGING_POLICY(KEY_LOGGING_POLICY);
TALVOX_EARLY const std::string Settings::SKS_EVENTS_LOGGING_POLICY(KEY_EVENTS_LOGGING_POLICY);
TALVOX_EARLY const std::string Settings::SKS_SOUND_FORMAT(KEY_SOUND_FORMAT);
TALVOX_EARLY const std::string Settings::SKS_SAMPLE_RATE(KEY_SAMPLE_RATE);
TALVOX_EARLY const std::string Settings::SKS_VAD_SETTINGS(KEY_VAD_SETTINGS);
TALVOX_EARLY const std::string Settings::SKS_SESSION_MODE(KEY_SESSION_MODE);
TALVOX_EARLY const std::string Settings::SKS_STREAMING(KEY_STREAMING);
TALVOX_EARLY const std::string Settings::SKS_UPPER_CONFIDENCE(KEY_UPPER_CONFIDENCE);
TALVOX_EARLY const std::string Settings::SKS_WINNER_LEAD_CONFIDENCE(KEY_WINNER_LEAD_CONFIDENCE);
TALVOX_EARLY const std::string Settings::SKS_LOWER_CONFIDENCE(KEY_LOWER_CONFIDENCE);
TALVOX_EARLY const std::string Settings::SKS_SPEEX_QUALITY(KEY_SPEEX_QUALITY);
TALVOX_EARLY const std::string Settings::SKS_VERBOSE_LEVEL(KEY_VERBOSE_LEVEL);
TALVOX_EARLY const std::string Settings::RS_LANGUAGE(KEY_LANGUAGE);
TALVOX_EARLY const std::string Settings::RS_MODEL(KEY_MODEL);
TALVOX_EARLY const std::string Settings::RS_ASR_POLICY(KEY_ASR_POLICY);
TALVOX_EARLY const std::string Settings::RS_MY_LL(KEY_MY_LL);
TALVOX_EARLY const std::string Settings::RS_CENTER_LL(KEY_CENTER_LL);
TALVOX_EARLY const std::string Settings::RS_SESSION_ID(KEY_SESSION_ID);

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

const Util::Bundle::ElemSpec Settings::bundleSpecs[] = {
    {KEY_URL, STRING, nullptr},
    {KEY_UUID, STRING, nullptr},
    {KEY_ASR_POLICY_OVERRIDE, STRING, nullptr},
    {KEY_LOGGING_POLICY, STRING, nullptr},
    {KEY_EVENTS_LOGGING_POLICY, STRING, nullptr},
    {KEY_SOUND_FORMAT, STRING, nullptr},
    {KEY_STREAMING, BOOLEAN, nullptr},
    {KEY_SAMPLE_RATE, INT, nullptr},
    {KEY_VAD_SETTINGS, STRING, nullptr},
    {KEY_SESSION_MODE, STRING, nullptr},
    {KEY_UPPER_CONFIDENCE, FLOAT, nullptr},
    {KEY_WINNER_LEAD_CONFIDENCE, FLOAT, nullptr},
    {KEY_LOWER_CONFIDENCE, FLOAT, nullptr},
    {KEY_SPEEX_QUALITY, INT, nullptr},
    {KEY_VERBOSE_LEVEL, INT, nullptr},
    {KEY_LANGUAGE, STRING, nullptr},
    {KEY_MODEL, STRING, nullptr},
    {KEY_ASR_POLICY, STRING, nullptr},
    {KEY_MY_LL, LATLON, nullptr},
    {KEY_CENTER_LL, LATLON, nullptr},
    {KEY_SESSION_ID, STRING, nullptr},
    // The end.
    {nullptr, BOOLEAN, nullptr}};

const Settings::KeyLevel Settings::keyLevels[] = {{KEY_URL, Level::ENGINE},
                                                  {KEY_UUID, Level::ENGINE},
                                                  {KEY_ASR_POLICY_OVERRIDE, Level::RECOGNIZER},
                                                  {KEY_LOGGING_POLICY, Level::RECOGNIZER},
                                                  {KEY_EVENTS_LOGGING_POLICY, Level::ENGINE},
                                                  {KEY_SOUND_FORMAT, Level::ENGINE_FOR_CLOUD},
                                                  {KEY_STREAMING, Level::ENGINE},
                                                  {KEY_SAMPLE_RATE, Level::ENGINE},
                                                  {KEY_VAD_SETTINGS, Level::ENGINE},
                                                  {KEY_SESSION_MODE, Level::ENGINE},
                                                  {KEY_UPPER_CONFIDENCE, Level::ENGINE},
                                                  {KEY_WINNER_LEAD_CONFIDENCE, Level::ENGINE},
                                                  {KEY_LOWER_CONFIDENCE, Level::ENGINE},
                                                  {KEY_SPEEX_QUALITY, Level::ENGINE_FOR_CLOUD},
                                                  {KEY_VERBOSE_LEVEL, Level::BOTH},
                                                  {KEY_LANGUAGE, Level::RECOGNIZER},
                                                  {KEY_MODEL, Level::RECOGNIZER},
                                                  {KEY_ASR_POLICY, Level::RECOGNIZER},
                                                  {KEY_MY_LL, Level::RECOGNIZER},
                                                  {KEY_CENTER_LL, Level::RECOGNIZER},
                                                  {KEY_SESSION_ID, Level::RECOGNIZER},
                                                  // The end.
                                                  {nullptr, Level::BOTH}};

}  // namespace Talvox
