#pragma once

#include <curl/curl.h>

#include <set>

namespace Network {

/** The sockets that libcurl has open, idle ones included. Network thread only. */
class OpenSockets {
  public:
    OpenSockets() = default;
    OpenSockets(const OpenSockets&) = delete;
    OpenSockets& operator=(const OpenSockets&) = delete;

    /** Has the sockets of this handle's connections made and closed here. */
    void attach(CURL* handle);

    /** Whether anything waits to be read on the connection from this port of ours. */
    bool hasArrivals(int ownPort) const;

  private:
    static curl_socket_t onOpen(void* self, curlsocktype purpose, curl_sockaddr* address);
    static int onClose(void* self, curl_socket_t socket);

    std::set<curl_socket_t> sockets;
};

}  // namespace Network
