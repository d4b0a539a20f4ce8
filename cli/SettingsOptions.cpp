#include "SettingsOptions.h"

#include <boost/make_shared.hpp>
#include <cerrno>
#include <climits>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <fstream>

#include "UsageError.h"
#include "core/util/Ascii.h"
#include "talvox/SettingsTable.h"

namespace Cli {

namespace {

using Util::Bundle;

// Well beyond what the engine accepts; a device that never ends must not fill the memory.
const std::size_t DOCUMENT_MAX_BYTES = std::size_t{16} * 1024 * 1024;

/** Words that leave no doubt; a document takes any word that it does not know for true. */
bool parseBoolean(const std::string& given, bool& value) {
    const std::string text = Util::toLower(given);
    value = text == "1" || text == "true" || text == "yes" || text == "on";
    return value || text == "0" || text == "false" || text == "no" || text == "off";
}

/** Decimal, 0x hexadecimal or leading-zero octal, and nothing behind it. */
bool parseInt(const std::string& text, int& value) {
    char* end = nullptr;
    errno = 0;
    const long long parsed = std::strtoll(text.c_str(), &end, 0);
    if (end == text.c_str() || *end != '\0' || errno != 0 || parsed < INT_MIN || parsed > INT_MAX) {
        return false;
    }
    value = static_cast<int>(parsed);
    return true;
}

/** Reads a number that ends at `stop`. */
bool parseFloat(const char* text, char stop, float& value, const char*& behind) {
    char* end = nullptr;
    value = std::strtof(text, &end);
    behind = end;
    return end != text && *end == stop && std::isfinite(value);
}

bool parseLatLon(const std::string& text, Bundle::LatLon& value) {
    const char* behind = nullptr;
    return parseFloat(text.c_str(), ',', value.lat, behind) &&
           parseFloat(behind + 1, '\0', value.lon, behind);
}

bool store(Talvox::Settings& settings, const std::string& key, Bundle::ElemType type,
           const std::string& text) {
    const char* behind = nullptr;
    bool booleanValue = false;
    int intValue = 0;
    float floatValue = 0;
    Bundle::LatLon position = {};
    switch (type) {
        case Bundle::BOOLEAN:
            if (!parseBoolean(text, booleanValue)) {
                return false;
            }
            settings.putBoolean(key, booleanValue);
            return true;
        case Bundle::STRING:
            settings.putString(key, text);
            return true;
        case Bundle::INT:
            if (!parseInt(text, intValue)) {
                return false;
            }
            settings.putInt(key, intValue);
            return true;
        case Bundle::FLOAT:
            if (!parseFloat(text.c_str(), '\0', floatValue, behind)) {
                return false;
            }
            settings.putFloat(key, floatValue);
            return true;
        case Bundle::LATLON:
            if (!parseLatLon(text, position)) {
                return false;
            }
            settings.putLatLon(key, position);
            return true;
        default:
            return false;
    }
}

const char* typeName(Bundle::ElemType type) {
    switch (type) {
        case Bundle::BOOLEAN:
            return "yes or no";
        case Bundle::INT:
            return "an integer";
        case Bundle::FLOAT:
            return "a number";
        case Bundle::LATLON:
            return "a position (latitude,longitude)";
        default:
            return "a value";
    }
}

void applyAssignment(Talvox::Settings& settings, const std::string& assignment) {
    const std::size_t equals = assignment.find('=');
    if (equals == std::string::npos) {
        throw UsageError("--set " + assignment + ": expected key=value");
    }
    assign(settings, assignment.substr(0, equals), assignment.substr(equals + 1));
}

void applyDocument(Talvox::Settings& settings, const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::string xml;
    char block[4096];
    while (file && xml.size() <= DOCUMENT_MAX_BYTES) {
        file.read(block, sizeof block);
        xml.append(block, static_cast<std::size_t>(file.gcount()));
    }
    if (!file.eof()) {
        const bool tooLarge = xml.size() > DOCUMENT_MAX_BYTES;
        throw UsageError(
            "cannot read " + path + ": " +
            (tooLarge ? "it is too large for a settings document" : std::strerror(errno)));
    }
    const std::string fault =
        xml.find('<') == std::string::npos
            ? "it is not XML"
            : settings.updateFromWholeXml(xml, Talvox::Settings::XML_PATH_DFLT,
                                          Talvox::Settings::bundleSpecs);
    if (!fault.empty()) {
        throw UsageError("cannot use " + path + ": " + fault);
    }
}

}  // namespace

void assign(Talvox::Settings& settings, const std::string& key, const std::string& text) {
    const Talvox::SettingRow* row = Talvox::SettingsTable::find(key);
    if (row == nullptr) {
        throw UsageError("there is no setting \"" + key + "\"");
    }
    if (!store(settings, row->key, row->type, text)) {
        throw UsageError("setting \"" + std::string(row->key) + "\": \"" + text + "\" is not " +
                         typeName(row->type));
    }
}

boost::shared_ptr<Talvox::Settings> buildSettings(const SettingsOptions& options) {
    auto settings = boost::make_shared<Talvox::Settings>();
    for (const auto& [key, text] : options.defaults) {
        assign(*settings, key, text);
    }
    if (!options.file.empty()) {
        applyDocument(*settings, options.file);
        if (options.repairDocument) {
            settings->validate();
        }
    }
    for (const std::string& assignment : options.assignments) {
        applyAssignment(*settings, assignment);
    }
    for (const auto& [key, text] : options.explicitValues) {
        assign(*settings, key, text);
    }
    return settings;
}

}  // namespace Cli
