#pragma once

#include "talvox/Settings.h"

namespace Talvox {

/** Reports settings that lack a key of the table, or have one more or one of another type. */
void requireConformance(const Settings& settings);

}  // namespace Talvox
