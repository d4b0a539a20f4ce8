#include "network/curl/PlatformAuthorities.h"

namespace Network {

struct PlatformAuthorities::Store {};

PlatformAuthorities::PlatformAuthorities() = default;
PlatformAuthorities::~PlatformAuthorities() = default;

bool PlatformAuthorities::attach(CURL*, bool) {
    return true;
}

}  // namespace Network
