#pragma once

#include <ostream>
#include <string>

#include "talvox/Settings.h"

namespace Cli {

/** Writes one line for each mistake in the "vad" setting. The detector takes any text. */
void warnOfVadMistakes(const Talvox::Settings& settings, std::ostream& err);

/** The parameters of the detector as a table: name, values, default, meaning. */
std::string vadParameterTable();

}  // namespace Cli
