#include "VadText.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <vector>

#include "cli/UsageError.h"
#include "talvox/EndOfSpeech.h"
#include "talvox/VadParameters.h"

namespace Cli {

namespace {

const std::string PRESET_PREFIX = "preset:";

std::vector<std::string> splitAtSemicolons(const std::string& text) {
    std::vector<std::string> parts;
    std::size_t begin = 0;
    while (begin < text.size()) {
        const std::size_t end = std::min(text.find(';', begin), text.size());
        if (end > begin) {
            parts.push_back(text.substr(begin, end - begin));
        }
        begin = end + 1;
    }
    return parts;
}

/** What the detector takes the name of a parameter for. */
std::string effectiveName(const std::string& parameter) {
    std::string name;
    for (const char character : parameter.substr(0, parameter.find('='))) {
        if (character != '_' && character != ' ') {
            name += static_cast<char>(std::tolower(static_cast<unsigned char>(character)));
        }
    }
    return name == "analyzems" ? "analyzemsoff" : name;
}

void append(std::string& text, const std::string& parameter) {
    text += text.empty() ? "" : ";";
    text += parameter;
}

}  // namespace

std::string mergeVad(const std::string& base, const std::string& changes) {
    const std::vector<std::string> changed = splitAtSemicolons(changes);
    std::string merged;
    for (const std::string& parameter : splitAtSemicolons(base)) {
        const bool isReplaced =
            std::any_of(changed.begin(), changed.end(), [&parameter](const std::string& change) {
                return effectiveName(change) == effectiveName(parameter);
            });
        if (!isReplaced) {
            append(merged, parameter);
        }
    }
    for (const std::string& change : changed) {
        append(merged, change);
    }
    return merged;
}

std::string parameterValue(const std::string& vad, const std::string& name) {
    std::string value;
    for (const Talvox::VadParameter& parameter : Talvox::VadParameters::all()) {
        if (parameter.name == name) {
            value = parameter.byDefault;
        }
    }
    for (const std::string& given : splitAtSemicolons(vad)) {
        if (effectiveName(given) == effectiveName(name)) {
            value = given.substr(std::min(given.size(), given.find('=') + 1));
        }
    }
    return value;
}

double parameterNumber(const std::string& vad, const std::string& name) {
    const std::string text = parameterValue(vad, name);
    double number = 0;
    std::from_chars(text.data(), text.data() + text.size(), number);
    return number;
}

std::string expandPreset(const std::string& vad) {
    if (vad.compare(0, PRESET_PREFIX.size(), PRESET_PREFIX) != 0) {
        return vad;
    }
    const std::size_t end = std::min(vad.find(';'), vad.size());
    const std::string name = vad.substr(PRESET_PREFIX.size(), end - PRESET_PREFIX.size());
    std::string known;
    for (const Talvox::EndOfSpeech& preset : Talvox::EndOfSpeech::all()) {
        if (name == preset.name) {
            return mergeVad(preset.parameters, vad.substr(end));
        }
        known += known.empty() ? "" : ", ";
        known += preset.name;
    }
    throw UsageError("there is no preset \"" + name + "\"; there are " + known);
}

}  // namespace Cli
