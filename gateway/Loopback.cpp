#include "gateway/Loopback.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>

#include "core/util/Ascii.h"

namespace Gateway {

namespace {

constexpr uint32_t LOOPBACK_NET = 127;
constexpr unsigned NET_SHIFT = 24;

bool isLoopback4(const in_addr& address) {
    return ntohl(address.s_addr) >> NET_SHIFT == LOOPBACK_NET;
}

bool isLoopback6(const in6_addr& address) {
    return IN6_IS_ADDR_LOOPBACK(&address);
}

/** Without the port; an address of version 6 without its brackets. */
std::string findName(const std::string& host) {
    if (!host.empty() && host[0] == '[') {
        const std::size_t end = host.find(']');
        return end == std::string::npos ? std::string() : host.substr(1, end - 1);
    }
    return host.substr(0, host.find(':'));
}

}  // namespace

bool isLoopback(const sockaddr& address) {
    if (address.sa_family == AF_INET) {
        return isLoopback4(reinterpret_cast<const sockaddr_in&>(address).sin_addr);
    }
    return address.sa_family == AF_INET6 &&
           isLoopback6(reinterpret_cast<const sockaddr_in6&>(address).sin6_addr);
}

bool namesLoopback(const std::string& host) {
    const std::string name = findName(host);
    in_addr v4{};
    in6_addr v6{};
    return Util::toLower(name) == "localhost" ||
           (inet_pton(AF_INET, name.c_str(), &v4) == 1 && isLoopback4(v4)) ||
           (inet_pton(AF_INET6, name.c_str(), &v6) == 1 && isLoopback6(v6));
}

}  // namespace Gateway
