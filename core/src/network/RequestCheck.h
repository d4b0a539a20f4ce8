#pragma once

#include <boost/shared_ptr.hpp>
#include <string>

#include "core/network/HttpRequest.h"

namespace Network {

/** Why a request must not go out; empty when it may. */
std::string findFault(const boost::shared_ptr<HttpRequest>& request);

}  // namespace Network
