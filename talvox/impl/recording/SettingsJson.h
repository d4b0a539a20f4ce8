/**
 * @file
 * Settings as JSON.
 */
#pragma once

#include <string>

#include "talvox/Settings.h"

namespace Talvox {

/** All settings by key, as docs/RECORDING.md says; the uuid is masked. */
std::string makeSettingsJson(const Settings& settings);

}  // namespace Talvox
