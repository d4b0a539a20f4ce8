#pragma once

#include <curl/curl.h>

#include <map>

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
    bool hasArrivals(int ownPort);

  private:
    static curl_socket_t onOpen(void* self, curlsocktype purpose, curl_sockaddr* address);
    static int onClose(void* self, curl_socket_t socket);

    /** With the port that a socket is bound to; 0 until someone asked for it. */
    std::map<curl_socket_t, int> sockets;
};

}  // namespace Network
