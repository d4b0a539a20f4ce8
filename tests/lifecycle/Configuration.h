/**
 * @file
 * The settings that sequences use.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "Plan.h"
#include "talvox/Settings.h"

namespace Lifecycle {

/** The engine's: all that matter, and some that are bad. @param index 0 to `SETTINGS_COUNT` - 1 */
boost::shared_ptr<Talvox::Settings> makeEngineSettings(int index);

/** A session's own. */
boost::shared_ptr<Talvox::Settings> makeSessionSettings(const SessionPlan& plan, int index);

/** Whether a request to their address can be made. */
bool isSendable(const Talvox::Settings& settings);

}  // namespace Lifecycle
