#pragma once

#include <string>

namespace Cli {

/**
 * A text of detector parameters in which the values of `changes` stand for those of `base`.
 * Parameters of equal effect, such as analyzems and analyzemsoff, replace each other.
 */
std::string mergeVad(const std::string& base, const std::string& changes);

/**
 * The text with "preset:NAME" at its beginning replaced by the parameters of that preset; what
 * follows behind a semicolon changes them. Any other text stays as it is.
 * @throws UsageError if there is no such preset
 */
std::string expandPreset(const std::string& vad);

/** The value that a parameter has with this text: the last that is given, or the default. */
std::string parameterValue(const std::string& vad, const std::string& name);

/** That value as a number; 0 if it is none. */
double parameterNumber(const std::string& vad, const std::string& name);

}  // namespace Cli
