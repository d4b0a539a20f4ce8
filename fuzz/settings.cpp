/* A configuration document: applied, repaired, written and read again. */
#include "talvox/Settings.h"

#include <algorithm>
#include <cmath>
#include <initializer_list>
#include <string>
#include <vector>

#include "Fuzz.h"
#include "support/LogCapture.h"

namespace {

using Fuzz::require;
using Talvox::Settings;

void requireOneOf(const Settings& settings, const std::string& key,
                  std::initializer_list<std::string> admissible) {
    require(std::count(admissible.begin(), admissible.end(), settings.getString(key)) == 1,
            "a repaired text is admissible");
}

void requireWithin(double value, double least, double most) {
    require(value >= least && value <= most, "a repaired number is in its range");
}

void requireValid(const Settings& settings) {
    requireOneOf(settings, Settings::SKS_ASR_POLICY_OVERRIDE,
                 {"default", "korvel_only_if_enabled", "korvel_only_everywhere",
                  "platform_only_if_enabled", "platform_only_everywhere",
                  "platform_first_if_enabled", "platform_first_everywhere", "disabled"});
    requireOneOf(settings, Settings::SKS_LOGGING_POLICY,
                 {"with_sound_always", "with_sound_if_wifi", "without_sound_always", "disabled"});
    requireOneOf(settings, Settings::SKS_EVENTS_LOGGING_POLICY, {"enabled", "disabled"});
    requireOneOf(settings, Settings::SKS_SOUND_FORMAT, {"pcm", "pcm_if_wifi", "speex"});
    requireOneOf(settings, Settings::SKS_SESSION_MODE, {"general", "voice_recognition"});
    requireOneOf(settings, Settings::RS_MODEL, {"general", "maps", "mapskvri", "ironlady"});
    requireOneOf(settings, Settings::RS_ASR_POLICY,
                 {"korvel_only", "platform_only", "platform_first", "disabled"});
    requireWithin(settings.getSampleRate(), 8000, 44100);
    requireWithin(settings.getInt(Settings::SKS_SPEEX_QUALITY), 0, 10);
    requireWithin(settings.getInt(Settings::SKS_VERBOSE_LEVEL), 0, 10);
    const float upper = settings.getFloat(Settings::SKS_UPPER_CONFIDENCE);
    requireWithin(static_cast<double>(upper), 0, 1);
    requireWithin(static_cast<double>(settings.getFloat(Settings::SKS_LOWER_CONFIDENCE)), 0,
                  static_cast<double>(upper));
    require(settings.getFloat(Settings::SKS_WINNER_LEAD_CONFIDENCE) >= 0,
            "the winner's lead is not negative");
}

bool startsWith(const std::string& text, const std::string& prefix) {
    return text.compare(0, prefix.size(), prefix) == 0;
}

/**
 * An update with a whole document is refused where one with any document logs an error, and makes
 * the same of all others.
 */
void requireSameFromWhole(const std::string& document, const Settings& updated,
                          const TestSupport::LogCapture& log) {
    const std::vector<std::string> messages = log.messages();
    const auto faults =
        std::count_if(messages.begin(), messages.end(), [](const std::string& message) {
            return startsWith(message, "Bundle::updateFromXml parse error: ") ||
                   startsWith(message, "updateFromXml: path ");
        });
    Settings whole;
    const std::string fault =
        whole.updateFromWholeXml(document, Settings::XML_PATH_DFLT, Settings::bundleSpecs);
    require((faults > 0) == !fault.empty(), "what is refused is what an update logs");
    require(
        whole.toXmlString("voice") == (fault.empty() ? updated : Settings()).toXmlString("voice"),
        "what is refused changes nothing");
}

/** What is valid stays as it is; only what is never repaired is complained about again. */
void requireUnchangedByRepair(Settings& settings, TestSupport::LogCapture& log) {
    const std::string before = settings.toXmlString("voice");
    log.clear();
    settings.validate();
    require(settings.toXmlString("voice") == before, "a second repair changes nothing");
    for (const std::string& message : log.messages()) {
        require(message == "TalvoxSettings::validate: empty url" ||
                    startsWith(message, "TalvoxSettings::validate: bad uuid"),
                "a second repair finds nothing to repair");
    }
}

/** Whether a text means the same after it was written, which escapes nothing. */
bool isPlain(const std::string& text) {
    if (text.empty()) {
        return true;
    }
    const bool hasMarkup = text.find_first_of("<&") != std::string::npos;
    const bool hasControls = std::any_of(text.begin(), text.end(),
                                         [](char c) { return (c >= 0 && c < ' ') || c == '\x7F'; });
    // Blanks are condensed, and the parser counts three characters of UTF-8 among them.
    const bool hasLooseBlanks = text.front() == ' ' || text.back() == ' ' ||
                                text.find("  ") != std::string::npos ||
                                text.find('\xEF') != std::string::npos;
    return !hasMarkup && !hasControls && !hasLooseBlanks;
}

/** Floats are written with six digits. */
bool isClose(float left, float right) {
    return std::fabs(left - right) <= std::fabs(left) * 1e-5F + 1e-44F;
}

bool isSameValue(const Settings::Elem& left, const Settings::Elem& right) {
    switch (left.type) {
        case Settings::FLOAT:
            return isClose(left.asFloat(), right.asFloat());
        case Settings::LATLON:
            return isClose(left.latLon.lat, right.latLon.lat) &&
                   isClose(left.latLon.lon, right.latLon.lon);
        default:
            return left.scalar == right.scalar && left.text == right.text;
    }
}

void requireSameAfterReading(const Settings& settings) {
    for (const std::string& key : settings.getKeys()) {
        if (settings.getType(key) == Settings::STRING && !isPlain(settings.getString(key))) {
            return;
        }
    }
    const std::string written = settings.toXmlString("voice");
    Settings read;
    read.updateFromXml("<startup><features>" + written + "</features></startup>",
                       Settings::XML_PATH_DFLT, Settings::bundleSpecs);
    require(read.toXmlString("voice") == written, "what was read is written as it was");
    for (const std::string& key : settings.getKeys()) {
        require(isSameValue(settings.get(key), read.get(key)),
                "what was written is read as it was");
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, std::size_t size) {
    TestSupport::LogCapture log;
    const std::string document = Fuzz::Input(data, size).takeRest();
    Settings settings;
    settings.updateFromXml(document, Settings::XML_PATH_DFLT, Settings::bundleSpecs);
    require(settings.conformsTo(Settings::bundleSpecs), "an update keeps keys and types");
    requireSameFromWhole(document, settings, log);
    requireSameAfterReading(settings);
    settings.validate();
    require(settings.conformsTo(Settings::bundleSpecs), "a repair keeps keys and types");
    requireValid(settings);
    requireUnchangedByRepair(settings, log);
    return 0;
}
