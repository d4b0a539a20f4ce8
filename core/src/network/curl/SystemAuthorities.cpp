#include "network/curl/PlatformAuthorities.h"

namespace Network {

struct PlatformAuthorities::Store {};

PlatformAuthorities::PlatformAuthorities() = default;
PlatformAuthorities::~PlatformAuthorities() = default;

bool PlatformAuthorities::attach(CURL*, const std::string&, bool) {
    return true;
}

}  // namespace Network
