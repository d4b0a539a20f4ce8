#include "talvox/impl/VadParameterText.h"

#include <algorithm>
#include <cctype>

namespace Talvox {

namespace {

std::vector<std::string> split(const std::string& text, char separator) {
    std::vector<std::string> parts;
    std::string::size_type begin = 0;
    for (auto end = text.find(separator); end != std::string::npos;
         end = text.find(separator, begin)) {
        parts.push_back(text.substr(begin, end - begin));
        begin = end + 1;
    }
    parts.push_back(text.substr(begin));
    return parts;
}

std::string normaliseName(std::string name) {
    name.erase(std::remove(name.begin(), name.end(), '_'), name.end());
    name.erase(std::remove(name.begin(), name.end(), ' '), name.end());
    std::transform(name.begin(), name.end(), name.begin(),
                   [](unsigned char letter) { return static_cast<char>(std::tolower(letter)); });
    return name;
}

}  // namespace

VadParameterText::VadParameterText(const std::string& text) {
    for (const std::string& setting : split(text, ';')) {
        if (setting.empty()) {
            continue;
        }
        const std::vector<std::string> parts = split(setting, '=');
        if (parts.size() > 2) {
            badSettings.push_back(setting);
            continue;
        }
        const std::string name = normaliseName(parts[0]);
        if (has(name)) {
            repeatedNames.push_back(name);
        }
        values[name] = parts.size() == 2 ? parts[1] : std::string();
    }
}

std::string VadParameterText::valueOf(const std::string& name, const std::string& otherwise) const {
    const auto found = values.find(name);
    return found != values.end() ? found->second : otherwise;
}

}  // namespace Talvox
