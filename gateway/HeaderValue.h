#pragma once

#include <string>
#include <utility>
#include <vector>

namespace Gateway {

/** A header value with parameters: `form-data; name="audio"`, `audio/x-pcm;bit=16;rate=16000`. */
struct HeaderValue {
    /** What stands before the first semicolon, in lower case. */
    std::string value;
    /** Names in lower case and values without their quotes, in order. */
    std::vector<std::pair<std::string, std::string>> parameters;

    /** The first parameter of that lower-case name, null when there is none. */
    const std::string* find(const std::string& name) const;

    /**
     * Takes a value apart.
     * @return false when it is malformed: no value, a parameter without "=", an open quote
     */
    static bool parse(const std::string& text, HeaderValue& result);
};

/** The text without blanks and tabs around it. */
std::string trimBlanks(const std::string& text);

}  // namespace Gateway
