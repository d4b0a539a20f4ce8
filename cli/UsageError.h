#pragma once

#include <stdexcept>
#include <string>

namespace Cli {

/**
 * Wrong usage or unreadable input: the tool prints the text as one line and ends with status 2.
 */
class UsageError : public std::runtime_error {
  public:
    explicit UsageError(const std::string& text) : std::runtime_error(text) {}
};

}  // namespace Cli
