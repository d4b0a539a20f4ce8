#include "Configuration.h"

#include <boost/make_shared.hpp>
#include <string>

#include "ScriptedGateway.h"

namespace Lifecycle {

using Talvox::Settings;

namespace {

const char* const URL = "http://gateway.invalid";
const char* const UUID = "0123456789abcdef0123456789abcdef";

}  // namespace

boost::shared_ptr<Settings> makeEngineSettings(int index) {
    static const char* const DETECTORS[] = {
        "activityon=-1;activityoff=2;minvoicetimems=600",  // speech for 700 ms
        "activityon=-1;activityoff=-1",                    // speech without an end
        "activityon=2"                                     // no speech
    };
    auto settings = boost::make_shared<Settings>();
    settings->putString(Settings::SKS_URL, URL);
    settings->putString(Settings::SKS_UUID, UUID);
    settings->putString(Settings::SKS_VAD_SETTINGS,
                        DETECTORS[index % 8 < 4 ? 0 : 1 + index / 2 % 2]);
    settings->putBoolean(Settings::SKS_STREAMING, index % 2 == 1);
    settings->putString(Settings::SKS_SOUND_FORMAT, index % 6 == 5 ? Settings::SOUND_FORMAT_SPEEX
                                                    : index % 6 == 4
                                                        ? Settings::SOUND_FORMAT_PCM_IF_WIFI
                                                        : Settings::SOUND_FORMAT_PCM);
    switch (index) {
        case 18:
            settings->putString(Settings::SKS_URL, "");
            break;
        case 19:
            settings->putString(Settings::SKS_UUID, "");
            break;
        case 20:
        case 21:
            settings->putString(Settings::SKS_URL, "http://gateway.invalid/with a blank");
            break;
        case 22:
            settings->putInt(Settings::SKS_VERBOSE_LEVEL, 2);
            settings->putInt(Settings::SKS_SAMPLE_RATE, 8000);
            break;
        case 23:
            settings->putString(Settings::SKS_SESSION_MODE, Settings::SESSION_MODE_GENERAL);
            break;
        default:
            break;
    }
    return settings;
}

boost::shared_ptr<Settings> makeSessionSettings(const SessionPlan& plan, int index) {
    static const std::string* const LOGGING[] = {
        &Settings::LOG_DISABLED, &Settings::LOG_WITH_SOUND_ALWAYS,
        &Settings::LOG_WITH_SOUND_IF_WIFI, &Settings::LOG_WITHOUT_SOUND_ALWAYS};
    static const auto base = boost::make_shared<Settings>();
    boost::shared_ptr<Settings> own = base->clone();
    own->putString(Settings::RS_SESSION_ID, ScriptedGateway::makeSessionId(index));
    if (plan.kind == Kind::STAND_IN) {
        own->putString(Settings::RS_ASR_POLICY, Settings::ASRP_DISABLED);
    } else if (plan.kind == Kind::PLATFORM) {
        own->putString(Settings::RS_ASR_POLICY, Settings::ASRP_PLATFORM_ONLY);
        own->putString(Settings::SKS_LOGGING_POLICY, *LOGGING[plan.device.logging % 4]);
        own->putString(Settings::SKS_SOUND_FORMAT, plan.device.logging < 4
                                                       ? Settings::SOUND_FORMAT_PCM
                                                       : Settings::SOUND_FORMAT_SPEEX);
    }
    return own;
}

bool isSendable(const Settings& settings) {
    return settings.getUrl().find(' ') == std::string::npos;
}

}  // namespace Lifecycle
