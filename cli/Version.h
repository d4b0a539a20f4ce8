#pragma once

#include <string>

namespace Cli {

/** "talvox 133 (build ...)". */
std::string versionText();

}  // namespace Cli
