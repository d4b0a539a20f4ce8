/**
 * @file
 * What the system's network interfaces say about reachability.
 */
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "core/Export.h"

namespace Network {

/** One interface of the host. */
struct NetworkInterface {
    /** The name that the system gives it, such as "eth0". */
    std::string name;
    /** It leads back to this host. */
    bool loopback = false;
    bool usable = false; /**< up and running, with an address that reaches further than the link */
};

/**
 * The host's interfaces now. Asks the kernel, never the network; any thread.
 * @return nothing when the kernel does not answer, for example without a free descriptor
 */
KORVEL_CORE_API std::optional<std::vector<NetworkInterface>> listNetworkInterfaces();

/**
 * The reachability over these interfaces: 1 when one that is not metered is usable, 2 when only
 * metered ones are (mobile broadband and dial-up, by name), 1 when only the loopback interface is,
 * 0 when none is.
 */
KORVEL_CORE_API int judgeReachability(const std::vector<NetworkInterface>& interfaces);

}  // namespace Network
