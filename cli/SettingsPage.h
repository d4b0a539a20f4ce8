#pragma once

#include <string>

namespace Cli {

/** All settings for a terminal: key, values, default and effect of each. */
std::string settingsHelp();

/** docs/SETTINGS.md. */
std::string settingsPage();

}  // namespace Cli
