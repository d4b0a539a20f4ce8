/**
 * @file
 * Arguments and environments of processes, as the system takes them.
 */
#pragma once

#include <string>
#include <utility>
#include <vector>

namespace TestSupport {

/** Names and values of environment variables. */
using Environment = std::vector<std::pair<std::string, std::string>>;

/** The environment of this process with `changes`, as lines "NAME=value". */
std::vector<std::string> mergeEnvironment(const Environment& changes);

/** Pointers into `texts`, then null. Valid until `texts` changes. */
std::vector<char*> toPointers(std::vector<std::string>& texts);

}  // namespace TestSupport
