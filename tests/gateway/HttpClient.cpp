#include "gateway/HttpClient.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <stdexcept>

#include "core/util/Ascii.h"
#include "gateway/Bodies.h"
#include "gateway/HeaderValue.h"

namespace GatewayTest {

HttpClient::HttpClient(uint16_t port) : socket(::socket(AF_INET, SOCK_STREAM, 0)) {
    const int on = 1;
    timeval patience{};
    patience.tv_sec = 30;
    setsockopt(socket, IPPROTO_TCP, TCP_NODELAY, &on, sizeof(on));
    setsockopt(socket, SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof(patience));
    setsockopt(socket, SOL_SOCKET, SO_SNDTIMEO, &patience, sizeof(patience));
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(port);
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    if (connect(socket, reinterpret_cast<sockaddr*>(&address), sizeof(address)) != 0) {
        close(socket);
        throw std::runtime_error("nobody listens on port " + std::to_string(port));
    }
}

HttpClient::~HttpClient() {
    if (socket >= 0) {
        close(socket);
    }
}

bool HttpClient::send(const std::string& bytes) {
    std::size_t sent = 0;
    while (sent < bytes.size()) {
        const ssize_t count =
            ::send(socket, bytes.data() + sent, bytes.size() - sent, MSG_NOSIGNAL);
        if (count <= 0) {
            return false;
        }
        sent += static_cast<std::size_t>(count);
    }
    return true;
}

bool HttpClient::sendChunk(const std::string& bytes) {
    char size[16];
    std::snprintf(size, sizeof(size), "%zx\r\n", bytes.size());
    return send(size + bytes + "\r\n");
}

HttpAnswer HttpClient::read() {
    HttpAnswer answer;
    while (buffer.find("\r\n\r\n") == std::string::npos) {
        if (!fill()) {
            return HttpAnswer();
        }
    }
    const std::size_t end = buffer.find("\r\n\r\n") + 2;
    answer.status = std::atoi(buffer.c_str() + buffer.find(' '));
    for (std::size_t line = buffer.find("\r\n") + 2; line < end;) {
        const std::size_t next = buffer.find("\r\n", line);
        const std::size_t colon = buffer.find(':', line);
        answer.headers[Util::toLower(buffer.substr(line, colon - line))] =
            Gateway::trimBlanks(buffer.substr(colon + 1, next - colon - 1));
        line = next + 2;
    }
    buffer.erase(0, end + 2);
    const std::size_t length = std::strtoul(answer.headers["content-length"].c_str(), nullptr, 10);
    while (buffer.size() < length && fill()) {
    }
    answer.body = buffer.substr(0, length);
    buffer.erase(0, length);
    return answer;
}

void HttpClient::reset() {
    linger hard{};
    hard.l_onoff = 1;
    setsockopt(socket, SOL_SOCKET, SO_LINGER, &hard, sizeof(hard));
    close(socket);
    socket = -1;
}

bool HttpClient::fill() {
    char bytes[16384];
    const ssize_t count = recv(socket, bytes, sizeof(bytes), 0);
    if (count <= 0) {
        return false;
    }
    buffer.append(bytes, static_cast<std::size_t>(count));
    return true;
}

std::string requestHead(const std::string& target, long length, const std::string& method) {
    return method + " " + target + " HTTP/1.1\r\nHost: localhost\r\n" +
           (length < 0 ? std::string("Transfer-Encoding: chunked")
                       : "Content-Length: " + std::to_string(length)) +
           "\r\nContent-Type: multipart/form-data; boundary=" + BOUNDARY + "\r\n\r\n";
}

}  // namespace GatewayTest
