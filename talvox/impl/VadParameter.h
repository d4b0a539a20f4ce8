/**
 * @file
 * Values of detector parameters.
 */
#pragma once

#include <cstdio>
#include <cstdlib>
#include <string>

namespace Talvox {

/** A decimal integer as `scanf` reads it; 0 for what is none. Too large numbers are cut to 32 bits.
 */
inline int parseIntParameter(const std::string& value) {
    return static_cast<int>(std::strtoll(value.c_str(), nullptr, 10));
}

/** A number as `scanf` reads it; 0 for what is none. */
inline float parseFloatParameter(const std::string& value) {
    float number = 0;
    return std::sscanf(value.c_str(), "%f", &number) == 1 ? number : 0.0F;
}

}  // namespace Talvox
