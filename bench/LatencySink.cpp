#include "bench/LatencySink.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <stdexcept>

#include "pal/kd_time.h"

namespace Bench {

namespace {

int listenOnLoopback(int& port) {
    const int listener = socket(AF_INET, SOCK_STREAM, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof(address);
    if (listener < 0 || bind(listener, reinterpret_cast<sockaddr*>(&address), size) != 0 ||
        listen(listener, 8) != 0 ||
        getsockname(listener, reinterpret_cast<sockaddr*>(&address), &size) != 0) {
        throw std::runtime_error("cannot listen on loopback");
    }
    port = ntohs(address.sin_port);
    return listener;
}

}  // namespace

LatencySink::LatencySink() : listener(listenOnLoopback(port)), thread([this] { serve(); }) {}

LatencySink::~LatencySink() {
    shutdown(listener, SHUT_RDWR);
    join();
    close(listener);
}

void LatencySink::join() {
    if (thread.joinable()) {
        thread.join();
    }
}

int64_t LatencySink::arrivalOf(std::size_t offset) const {
    const auto found = std::upper_bound(
        arrivals.begin(), arrivals.end(), offset,
        [](std::size_t wanted, const auto& arrival) { return wanted < arrival.first; });
    return found == arrivals.end() ? -1 : found->second;
}

void LatencySink::serve() {
    const int connection = accept(listener, nullptr, nullptr);
    if (connection < 0) {
        return;
    }
    char buffer[65536];
    while (state != State::DONE) {
        const ssize_t got = recv(connection, buffer, sizeof(buffer), 0);
        if (got <= 0) {
            break;
        }
        decode(buffer, static_cast<std::size_t>(got));
        if (!body.empty()) {
            arrivals.emplace_back(body.size(), kdGetTimeUST());
        }
    }
    const std::string answer = "HTTP/1.1 200 OK\r\nContent-Length: 0\r\n\r\n";
    if (send(connection, answer.data(), answer.size(), MSG_NOSIGNAL) < 0) {
        body.clear();
    }
    close(connection);
}

void LatencySink::decode(const char* data, std::size_t size) {
    for (std::size_t i = 0; i < size && state != State::DONE;) {
        if (state == State::DATA) {
            const std::size_t part = std::min(chunkLeft, size - i);
            body.append(data + i, part);
            i += part;
            chunkLeft -= part;
            if (chunkLeft == 0) {
                state = State::DATA_END;
            }
            continue;
        }
        line += data[i++];
        const bool ended = line.size() >= 2 && line.compare(line.size() - 2, 2, "\r\n") == 0;
        if (!ended) {
            continue;
        }
        if (state == State::HEAD) {
            state = line == "\r\n" ? State::SIZE : State::HEAD;
        } else if (state == State::DATA_END) {
            state = State::SIZE;
        } else {
            chunkLeft = std::strtoul(line.c_str(), nullptr, 16);
            state = chunkLeft == 0 ? State::DONE : State::DATA;
        }
        line.clear();
    }
}

std::pair<int, int> tcpPair() {
    int port = 0;
    const int listener = listenOnLoopback(port);
    const int client = socket(AF_INET, SOCK_STREAM, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    address.sin_port = htons(static_cast<uint16_t>(port));
    if (client < 0 ||
        connect(client, reinterpret_cast<sockaddr*>(&address), sizeof(address)) != 0) {
        throw std::runtime_error("cannot connect on loopback");
    }
    const int server = accept(listener, nullptr, nullptr);
    close(listener);
    const int on = 1;
    setsockopt(client, IPPROTO_TCP, TCP_NODELAY, &on, sizeof(on));
    return {client, server};
}

}  // namespace Bench
