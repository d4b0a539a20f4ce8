#include "core/network/NetworkInterfaces.h"

#include <ifaddrs.h>
#include <net/if.h>
#include <netinet/in.h>
#include <sys/socket.h>

#include <algorithm>
#include <array>
#include <memory>

#include "core/network/NetworkManager.h"

namespace Network {

namespace {

bool isMetered(const NetworkInterface& interface) {
    static const std::array<const char*, 5> PREFIXES{"wwan", "ppp", "rmnet", "ccmni", "clat"};
    return std::any_of(PREFIXES.begin(), PREFIXES.end(), [&interface](const char* prefix) {
        return interface.name.rfind(prefix, 0) == 0;
    });
}

bool hasUsableAddress(const ifaddrs& entry) {
    if (entry.ifa_addr == nullptr) {
        return false;
    }
    if (entry.ifa_addr->sa_family == AF_INET) {
        return true;
    }
    if (entry.ifa_addr->sa_family != AF_INET6) {
        return false;
    }
    const auto* const address = reinterpret_cast<const sockaddr_in6*>(entry.ifa_addr);
    return IN6_IS_ADDR_LINKLOCAL(&address->sin6_addr) == 0;
}

NetworkInterface& findOrAdd(std::vector<NetworkInterface>& interfaces, const std::string& name) {
    const auto found =
        std::find_if(interfaces.begin(), interfaces.end(),
                     [&name](const NetworkInterface& known) { return known.name == name; });
    if (found != interfaces.end()) {
        return *found;
    }
    interfaces.push_back({name, false, false});
    return interfaces.back();
}

}  // namespace

std::optional<std::vector<NetworkInterface>> listNetworkInterfaces() {
    ifaddrs* list = nullptr;
    if (getifaddrs(&list) != 0) {
        return std::nullopt;
    }
    std::vector<NetworkInterface> interfaces;
    const std::unique_ptr<ifaddrs, void (*)(ifaddrs*)> owner(list, &freeifaddrs);
    for (const ifaddrs* entry = list; entry != nullptr; entry = entry->ifa_next) {
        constexpr unsigned WORKING = IFF_UP | IFF_RUNNING;
        NetworkInterface& interface = findOrAdd(interfaces, entry->ifa_name);
        interface.loopback = (entry->ifa_flags & IFF_LOOPBACK) != 0;
        interface.usable = interface.usable ||
                           ((entry->ifa_flags & WORKING) == WORKING && hasUsableAddress(*entry));
    }
    return interfaces;
}

int judgeReachability(const std::vector<NetworkInterface>& interfaces) {
    bool loopback = false;
    bool metered = false;
    for (const NetworkInterface& interface : interfaces) {
        if (!interface.usable) {
            continue;
        }
        if (interface.loopback) {
            loopback = true;
        } else if (isMetered(interface)) {
            metered = true;
        } else {
            return NetworkManager::WIFI;
        }
    }
    if (metered) {
        return NetworkManager::METERED;
    }
    return loopback ? NetworkManager::WIFI : NetworkManager::UNREACHABLE;
}

}  // namespace Network
