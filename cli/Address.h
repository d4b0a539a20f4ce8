#pragma once

#include <string>

#include "talvox/Settings.h"

namespace Cli {

/**
 * Checks an address before anything is sent to it.
 * @throws UsageError if it is empty or the network layer would refuse it
 */
void checkUrl(const std::string& url);

/**
 * Checks a value that becomes part of a request's address; it may be empty.
 * @param name the value's name in the message, such as "uuid"
 * @throws UsageError if the network layer would refuse the address because of it
 */
void checkQueryValue(const std::string& name, const std::string& text);

/**
 * Checks all settings without which no recognition request can be made.
 * @throws UsageError naming the first that is missing or wrong
 */
void checkRequestSettings(const Talvox::Settings& settings);

}  // namespace Cli
