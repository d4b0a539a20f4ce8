#include "gateway/HeaderValue.h"

#include <algorithm>
#include <cstddef>

#include "core/util/Ascii.h"

namespace Gateway {

namespace {

bool isBlank(char c) {
    return c == ' ' || c == '\t';
}

void skipBlanks(const std::string& text, std::size_t& position) {
    while (position < text.size() && isBlank(text[position])) {
        ++position;
    }
}

/** Reads a quoted value whose opening quote stands at `position`. */
bool readQuoted(const std::string& text, std::size_t& position, std::string& value) {
    for (++position; position < text.size(); ++position) {
        const char c = text[position];
        if (c == '"') {
            ++position;
            return true;
        }
        if (c == '\\' && position + 1 < text.size()) {
            value += text[++position];
        } else {
            value += c;
        }
    }
    return false;
}

bool readParameter(const std::string& text, std::size_t& position,
                   std::pair<std::string, std::string>& parameter) {
    const std::size_t equals = text.find('=', position);
    if (equals == std::string::npos) {
        return false;
    }
    parameter.first = Util::toLower(trimBlanks(text.substr(position, equals - position)));
    if (parameter.first.empty() || parameter.first.find(';') != std::string::npos) {
        return false;
    }
    position = equals + 1;
    skipBlanks(text, position);
    if (position < text.size() && text[position] == '"') {
        return readQuoted(text, position, parameter.second);
    }
    const std::size_t end = std::min(text.find(';', position), text.size());
    parameter.second = trimBlanks(text.substr(position, end - position));
    position = end;
    return true;
}

}  // namespace

const std::string* HeaderValue::find(const std::string& name) const {
    for (const auto& parameter : parameters) {
        if (parameter.first == name) {
            return &parameter.second;
        }
    }
    return nullptr;
}

bool HeaderValue::parse(const std::string& text, HeaderValue& result) {
    result = HeaderValue();
    std::size_t position = std::min(text.find(';'), text.size());
    result.value = Util::toLower(trimBlanks(text.substr(0, position)));
    if (result.value.empty()) {
        return false;
    }
    while (position < text.size()) {
        if (text[position] != ';') {
            return false;
        }
        ++position;
        skipBlanks(text, position);
        if (position == text.size()) {
            break;
        }
        std::pair<std::string, std::string> parameter;
        if (!readParameter(text, position, parameter)) {
            return false;
        }
        result.parameters.push_back(parameter);
        skipBlanks(text, position);
    }
    return true;
}

std::string trimBlanks(const std::string& text) {
    const std::size_t first = text.find_first_not_of(" \t");
    if (first == std::string::npos) {
        return std::string();
    }
    return text.substr(first, text.find_last_not_of(" \t") - first + 1);
}

}  // namespace Gateway
