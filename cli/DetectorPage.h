#pragma once

#include <string>

namespace Cli {

/** docs/DETECTOR.md. */
std::string detectorPage();

}  // namespace Cli
