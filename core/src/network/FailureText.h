#pragma once

#include <string>

#include "core/network/HttpResponse.h"

namespace Network {

/**
 * Makes a text fit to be the reason of a failure: printable ASCII on one line, at most 200 bytes.
 * libcurl's texts quote the peer (a host name, a certificate), which may hold anything.
 */
std::string makeReason(const std::string& text);

/** The reason that a complete response gives; empty when its status reports a success. */
std::string describeStatus(const HttpResponse& response);

/** The reason when the peer let the time-out of the request pass. */
std::string describeTimeout(int timeoutMs);

}  // namespace Network
