/**
 * @file
 * The grammar of the "vad" setting.
 */
#pragma once

#include <map>
#include <string>
#include <vector>

namespace Talvox {

/**
 * A parameter text ("name=value;name=value") taken apart. In names, "_" and blanks do not count,
 * nor does case; values are kept as written.
 */
struct VadParameterText {
    explicit VadParameterText(const std::string& text);

    /** The value of a parameter, or `otherwise` where it is not given. */
    std::string valueOf(const std::string& name,
                        const std::string& otherwise = std::string()) const;
    bool has(const std::string& name) const { return values.count(name) > 0; }

    /** By normalised name; the last value of each. One without "=" has an empty value. */
    std::map<std::string, std::string> values;
    /** Names that were given more than once, once for each repetition. */
    std::vector<std::string> repeatedNames;
    /** Settings with more than one "=", which do not count, as they were written. */
    std::vector<std::string> badSettings;
};

}  // namespace Talvox
