#include "network/curl/OpenSockets.h"

#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>

#include "network/curl/CurlGuard.h"

namespace Network {

namespace {

/** The port that a socket is bound to, 0 for none. */
int getOwnPort(curl_socket_t socket) {
    sockaddr_storage address{};
    socklen_t length = sizeof(address);
    if (::getsockname(socket, reinterpret_cast<sockaddr*>(&address), &length) != 0) {
        return 0;
    }
    if (address.ss_family == AF_INET6) {
        return ntohs(reinterpret_cast<const sockaddr_in6*>(&address)->sin6_port);
    }
    return address.ss_family == AF_INET
               ? ntohs(reinterpret_cast<const sockaddr_in*>(&address)->sin_port)
               : 0;
}

}  // namespace

void OpenSockets::attach(CURL* handle) {
    curl_easy_setopt(handle, CURLOPT_OPENSOCKETFUNCTION, &OpenSockets::onOpen);
    curl_easy_setopt(handle, CURLOPT_OPENSOCKETDATA, this);
    curl_easy_setopt(handle, CURLOPT_CLOSESOCKETFUNCTION, &OpenSockets::onClose);
    curl_easy_setopt(handle, CURLOPT_CLOSESOCKETDATA, this);
}

bool OpenSockets::hasArrivals(int ownPort) {
    // Connections to different hosts may share a port; then one of the others costs a new one.
    return ownPort > 0 && std::any_of(sockets.begin(), sockets.end(), [ownPort](auto& entry) {
               entry.second = entry.second > 0 ? entry.second : getOwnPort(entry.first);
               pollfd question{entry.first, POLLIN, 0};
               return entry.second == ownPort && ::poll(&question, 1, 0) > 0;
           });
}

curl_socket_t OpenSockets::onOpen(void* self, curlsocktype, curl_sockaddr* address) {
    const curl_socket_t socket =
        ::socket(address->family, address->socktype | SOCK_CLOEXEC, address->protocol);
    if (socket < 0) {
        return CURL_SOCKET_BAD;
    }
    const curl_socket_t known = guardForCurl(CURL_SOCKET_BAD, [self, socket] {
        static_cast<OpenSockets*>(self)->sockets.emplace(socket, 0);
        return socket;
    });
    if (known == CURL_SOCKET_BAD) {
        ::close(socket);
    }
    return known;
}

int OpenSockets::onClose(void* self, curl_socket_t socket) {
    static_cast<OpenSockets*>(self)->sockets.erase(socket);
    return ::close(socket);
}

}  // namespace Network
