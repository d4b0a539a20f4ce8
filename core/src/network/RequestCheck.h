#pragma once

#include <boost/shared_ptr.hpp>

#include "core/network/HttpRequest.h"

namespace Network {

/** Whether a request may go out; a line in the log tells why not. */
bool canBeSent(const boost::shared_ptr<HttpRequest>& request);

}  // namespace Network
