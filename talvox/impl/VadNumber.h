/**
 * @file
 * Values of detector parameters, the same in every locale.
 */
#pragma once

#include <string>

namespace Talvox {

/** A value as a detector reads it. */
template <typename Number>
struct VadNumber {
    Number value = 0; /**< 0 where the text begins with no number */
    bool isNumber = false;
    bool isWholeText = false; /**< nothing stands behind the number */
};

/** A decimal integer as `scanf` reads it with "%d". Too large numbers are cut to 32 bits. */
VadNumber<int> readIntParameter(const std::string& text);

/** A number as `scanf` reads it with "%f" in the "C" locale, infinity and not-a-number included. */
VadNumber<float> readFloatParameter(const std::string& text);

inline int parseIntParameter(const std::string& text) {
    return readIntParameter(text).value;
}

inline float parseFloatParameter(const std::string& text) {
    return readFloatParameter(text).value;
}

}  // namespace Talvox
