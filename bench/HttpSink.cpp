#include "bench/HttpSink.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <unistd.h>

#include <stdexcept>
#include <utility>

namespace Bench {

namespace {

const std::string ANSWER = "HTTP/1.1 200 OK\r\nContent-Length: 0\r\n\r\n";
const std::string HEAD_END = "\r\n\r\n";

}  // namespace

HttpSink::HttpSink() : listener(socket(AF_INET, SOCK_STREAM, 0)) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof(address);
    auto* const generic = reinterpret_cast<sockaddr*>(&address);
    if (listener < 0 || bind(listener, generic, size) != 0 || listen(listener, 8) != 0 ||
        getsockname(listener, generic, &size) != 0) {
        throw std::runtime_error("cannot listen on loopback");
    }
    port = ntohs(address.sin_port);
    thread = std::thread([this] { serve(); });
}

HttpSink::~HttpSink() {
    shutdown(listener, SHUT_RDWR);
    thread.join();
    for (std::size_t i = 0; i < servers.size(); ++i) {
        shutdown(connections[i], SHUT_RDWR);
        servers[i].join();
        close(connections[i]);
    }
    close(listener);
}

HttpSink::Traffic HttpSink::takeTraffic() {
    const std::lock_guard<std::mutex> lock(mutex);
    return std::exchange(traffic, Traffic());
}

void HttpSink::serve() {
    for (int connection = accept(listener, nullptr, nullptr); connection >= 0;
         connection = accept(listener, nullptr, nullptr)) {
        const int on = 1;
        setsockopt(connection, IPPROTO_TCP, TCP_NODELAY, &on, sizeof(on));
        {
            const std::lock_guard<std::mutex> lock(mutex);
            ++traffic.connections;
        }
        connections.push_back(connection);
        servers.emplace_back([this, connection] { serveConnection(connection); });
    }
}

void HttpSink::serveConnection(int connection) {
    std::string head;
    char buffer[16384];
    for (;;) {
        const ssize_t got = recv(connection, buffer, sizeof(buffer), 0);
        if (got <= 0) {
            return;
        }
        head.append(buffer, static_cast<std::size_t>(got));
        for (std::size_t end = head.find(HEAD_END); end != std::string::npos;
             end = head.find(HEAD_END)) {
            const std::size_t start = head.find(' ') + 1;
            {
                const std::lock_guard<std::mutex> lock(mutex);
                traffic.targets.push_back(head.substr(start, head.find(' ', start) - start));
            }
            head.erase(0, end + HEAD_END.size());
            if (send(connection, ANSWER.data(), ANSWER.size(), MSG_NOSIGNAL) < 0) {
                return;
            }
        }
    }
}

}  // namespace Bench
