#include "gateway/RequestFields.h"

#include <cmath>
#include <cstdlib>

namespace Gateway {

namespace {

/** One decimal number with nothing around it. */
bool isNumber(const std::string& text) {
    if (text.empty() || text.find_first_not_of("0123456789+-.eE") != std::string::npos) {
        return false;
    }
    char* end = nullptr;
    const double number = std::strtod(text.c_str(), &end);
    return *end == '\0' && std::isfinite(number);
}

bool isCoordinatePair(const std::string& text) {
    const std::size_t comma = text.find(',');
    return comma != std::string::npos && isNumber(text.substr(0, comma)) &&
           isNumber(text.substr(comma + 1));
}

}  // namespace

std::string RequestFields::begin(const std::string& name) {
    if (!values.emplace(name, std::string()).second) {
        return "the field " + name + " stands there twice";
    }
    open = name;
    return std::string();
}

std::string RequestFields::append(const char* data, std::size_t size) {
    std::string& value = values[open];
    const std::size_t limit = open == "transcripts" ? MAX_TRANSCRIPTS_BYTES : MAX_VALUE_BYTES;
    if (size > limit - value.size()) {
        return "the field " + open + " is too long";
    }
    value.append(data, size);
    return std::string();
}

std::string RequestFields::end() {
    const std::string& value = values[open];
    if ((open == "uuid" || open == "lang" || open == "topic") && value.empty()) {
        return "the field " + open + " is empty";
    }
    if ((open == "myll" || open == "centerll") && !isCoordinatePair(value)) {
        return "the field " + open + " is not two numbers with a comma between them: " + value;
    }
    if (open == "canceled" && value != "true") {
        return "the field canceled has another value than true: " + value;
    }
    return std::string();
}

const std::string& RequestFields::get(const std::string& name) const {
    static const std::string nothing;
    const auto found = values.find(name);
    return found == values.end() ? nothing : found->second;
}

std::string RequestFields::findMissing() const {
    for (const char* name : {"uuid", "lang", "topic", "myll", "centerll"}) {
        if (!has(name)) {
            return std::string("the field ") + name + " is missing";
        }
    }
    return std::string();
}

}  // namespace Gateway
