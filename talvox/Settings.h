/**
 * @file
 * The settings of the engine and of each recognition.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <string>

#include "talvox/Export.h"
#include "util/Bundle.h"

namespace Talvox {

/**
 * A settings tree that is born with every known key at its default, so readers may fetch any key.
 *
 * The same keys live in the engine's object and in that of each recognizer; `keyLevels` says whose
 * value counts. Mostly those of `SKS_` keys count on the engine and those of `RS_` keys on a
 * recognizer; "asr" and "logging" are exceptions.
 *
 * What is checked: `createRecognizer` repairs its copy of a recognizer's settings with `validate`.
 * The engine's own settings are not repaired: a sample rate of 1000 opens the recorder at 1000.
 * Call `validate` before `Talvox::setTalvoxSettings` where values come from outside.
 *
 * One owner changes an object; afterwards it is shared read-only (see `Util::Bundle`). The
 * constants are the only spelling of keys and values, and may be used from static initialisers.
 */
class TALVOX_API Settings : public Util::Bundle {
  public:
    /** Text, "": base address of the recognition service. */
    static const std::string SKS_URL;
    /** Text, "": identifier of the installation, 32 characters; sent with every request. */
    static const std::string SKS_UUID;
    /** Text, `ASRO_DEFAULT`: engine-wide override of the recognition mechanism. */
    static const std::string SKS_ASR_POLICY_OVERRIDE;
    /**
     * Text, `LOG_DISABLED`: whether and how a device recognizer sends its sessions to the service.
     */
    static const std::string SKS_LOGGING_POLICY;
    /** Text, `EVENTS_LOG_DISABLED`: usage-event logging. */
    static const std::string SKS_EVENTS_LOGGING_POLICY;
    /** Text, `SOUND_FORMAT_PCM_IF_WIFI`: format in which sound is sent. */
    static const std::string SKS_SOUND_FORMAT;
    /** Integer, 16000: sample rate of the recording in Hz, 8000 to 44100. */
    static const std::string SKS_SAMPLE_RATE;
    /** Text, "": parameters of the voice activity detector. */
    static const std::string SKS_VAD_SETTINGS;
    /** Text, `SESSION_MODE_VOICE_RECOGNITION`: audio session mode of the recorder. */
    static const std::string SKS_SESSION_MODE;
    /** Boolean, false: stream the sound while it is recorded instead of sending it in one piece. */
    static const std::string SKS_STREAMING;
    /** Float, 0.9: upper confidence threshold, 0 to 1. */
    static const std::string SKS_UPPER_CONFIDENCE;
    /** Float, 0.2: lead that the best hypothesis needs over the next; 0 or more. */
    static const std::string SKS_WINNER_LEAD_CONFIDENCE;
    /** Float, 0.4: lower confidence threshold, 0 to the upper one. */
    static const std::string SKS_LOWER_CONFIDENCE;
    /** Integer, 8: quality of the Speex encoder, 0 to 10. */
    static const std::string SKS_SPEEX_QUALITY;
    /**
     * Integer, 0: diagnostic verbosity, 0 to 10. The engine's is for the lines of a session; with a
     * recognizer's own above 0, `createRecognizer` logs its settings.
     */
    static const std::string SKS_VERBOSE_LEVEL;
    /** Text, "ru-RU": recognition language. */
    static const std::string RS_LANGUAGE;
    /** Text, `MODEL_GENERAL`: recognition model. */
    static const std::string RS_MODEL;
    /** Text, `ASRP_KORVEL_ONLY`: the application's choice of the recognition mechanism. */
    static const std::string RS_ASR_POLICY;
    /** Position, 0, 0: where the user is. */
    static const std::string RS_MY_LL;
    /** Position, 0, 0: centre of the map that the user sees. */
    static const std::string RS_CENTER_LL;
    /** Text, "": the application's session identifier. */
    static const std::string RS_SESSION_ID;

    /** Values of `SKS_ASR_POLICY_OVERRIDE`. */
    static const std::string ASRO_DEFAULT;
    static const std::string ASRO_KORVEL_ONLY_IF_ENABLED;
    static const std::string ASRO_KORVEL_ONLY_EVERYWHERE;
    static const std::string ASRO_PLATFORM_ONLY_IF_ENABLED;
    static const std::string ASRO_PLATFORM_ONLY_EVERYWHERE;
    static const std::string ASRO_PLATFORM_FIRST_IF_ENABLED;
    static const std::string ASRO_PLATFORM_FIRST_EVERYWHERE;
    static const std::string ASRO_DISABLED;

    /** Values of `SKS_LOGGING_POLICY`. */
    static const std::string LOG_WITH_SOUND_ALWAYS;
    static const std::string LOG_WITH_SOUND_IF_WIFI;
    static const std::string LOG_WITHOUT_SOUND_ALWAYS;
    static const std::string LOG_DISABLED;

    /** Values of `SKS_EVENTS_LOGGING_POLICY`. */
    static const std::string EVENTS_LOG_ENABLED;
    static const std::string EVENTS_LOG_DISABLED;

    /** Values of `SKS_SOUND_FORMAT`. */
    static const std::string SOUND_FORMAT_PCM;
    static const std::string SOUND_FORMAT_PCM_IF_WIFI;
    static const std::string SOUND_FORMAT_SPEEX;

    /** Values of `SKS_SESSION_MODE`. */
    static const std::string SESSION_MODE_GENERAL;
    static const std::string SESSION_MODE_VOICE_RECOGNITION;

    /** Values of `RS_MODEL`. */
    static const std::string MODEL_GENERAL;
    static const std::string MODEL_MAPS;
    static const std::string MODEL_MAPSKVRI;
    static const std::string MODEL_IRONLADY;

    /** Values of `RS_ASR_POLICY`. */
    static const std::string ASRP_KORVEL_ONLY;
    static const std::string ASRP_PLATFORM_ONLY;
    static const std::string ASRP_PLATFORM_FIRST;
    static const std::string ASRP_DISABLED;

    /** Path of the element in a configuration document whose children update the settings. */
    static const std::string XML_PATH_DFLT;

    /** The keys and their types: what every settings object conforms to. */
    static const ElemSpec bundleSpecs[];

    /** Whose value of a key counts in a recognition. */
    enum class Level {
        ENGINE,           /**< the engine's; a recognizer's own has no effect */
        ENGINE_FOR_CLOUD, /**< as `ENGINE`, but a device recognizer goes by its own */
        RECOGNIZER,       /**< the recognizer's own; the engine's has no effect */
        BOTH              /**< both, each for its part */
    };

    /** A row of `keyLevels`. */
    struct KeyLevel {
        /** As normalised. */
        const char* key;
        /** Whose value counts. */
        Level level;
    };

    /** The level of every key, in the order of `bundleSpecs`; ended by a row with a null key. */
    static const KeyLevel keyLevels[];

    /** All defaults. */
    Settings();
    Settings(const Settings&) = default;
    Settings& operator=(const Settings&) = default;
    ~Settings() override;

    /** A copy; sub-bundles are shared with this one. */
    boost::shared_ptr<Settings> clone() const;

    /**
     * Repairs bad values in place, each with a line in the log. A threshold that is not a number
     * is bad. An empty address and a bad identifier are only reported. The object must conform to
     * `bundleSpecs`.
     */
    void validate();

    /** References stay valid until the key is put again. */
    const std::string& getUrl() const;
    const std::string& getUuid() const;
    const std::string& getLanguage() const;
    const std::string& getModel() const;
    const std::string& getSessionId() const;
    /** In Hz. */
    int getSampleRate() const;
};

}  // namespace Talvox
