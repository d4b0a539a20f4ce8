#pragma once

#include <string>

namespace Gateway {

/**
 * A client's text as it may stand in a log line: "-" when it is empty, in quotes when there are
 * blanks in it, bytes that are not printable ASCII as \xNN, and cut after 300 bytes.
 */
std::string toLogText(const std::string& text);

}  // namespace Gateway
