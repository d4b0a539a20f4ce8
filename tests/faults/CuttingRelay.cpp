#include "CuttingRelay.h"

#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <chrono>
#include <stdexcept>
#include <vector>

namespace FaultTest {

namespace {

sockaddr_in loopback(unsigned short port) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    address.sin_port = htons(port);
    return address;
}

void resetAndClose(int socket) {
    const linger abort{1, 0};
    ::setsockopt(socket, SOL_SOCKET, SO_LINGER, &abort, sizeof(abort));
    ::close(socket);
}

}  // namespace

CuttingRelay::CuttingRelay(unsigned short serverPort, std::size_t bytesOfTheFirst)
    : target(serverPort), limit(bytesOfTheFirst) {
    listener = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_in address = loopback(0);
    socklen_t length = sizeof(address);
    auto* const generic = reinterpret_cast<sockaddr*>(&address);
    if (::bind(listener, generic, length) != 0 || ::listen(listener, 8) != 0 ||
        ::getsockname(listener, generic, &length) != 0 || ::pipe(stopSignal) != 0) {
        throw std::runtime_error("no socket for the relay");
    }
    port = ntohs(address.sin_port);
    thread = std::thread([this] { run(); });
}

CuttingRelay::~CuttingRelay() {
    ::close(stopSignal[1]);
    thread.join();
    ::close(stopSignal[0]);
    ::close(listener);
}

std::string CuttingRelay::getUrl() const {
    return "http://127.0.0.1:" + std::to_string(port);
}

bool CuttingRelay::waitForConnections(std::size_t count, int milliseconds) const {
    std::unique_lock<std::mutex> lock(mutex);
    return changed.wait_for(lock, std::chrono::milliseconds(milliseconds),
                            [this, count] { return connections >= count; });
}

bool CuttingRelay::waitForCut() const {
    std::unique_lock<std::mutex> lock(mutex);
    return changed.wait_for(lock, std::chrono::seconds(20), [this] { return cut; });
}

void CuttingRelay::run() {
    pollfd entries[2] = {{listener, POLLIN, 0}, {stopSignal[0], POLLIN, 0}};
    for (bool first = true; ::poll(entries, 2, -1) > 0 && entries[1].revents == 0; first = false) {
        const int client = ::accept4(listener, nullptr, nullptr, SOCK_CLOEXEC);
        {
            const std::lock_guard<std::mutex> lock(mutex);
            ++connections;
            changed.notify_all();
        }
        serve(client, first);
    }
}

void CuttingRelay::serve(int client, bool cuts) {
    const int server = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    const sockaddr_in address = loopback(target);
    std::size_t sent = 0;
    std::size_t received = 0;
    bool open =
        ::connect(server, reinterpret_cast<const sockaddr*>(&address), sizeof(address)) == 0;
    pollfd entries[3] = {{client, POLLIN, 0}, {server, POLLIN, 0}, {stopSignal[0], POLLIN, 0}};
    while (open && ::poll(entries, 3, -1) > 0 && entries[2].revents == 0) {
        open = (entries[0].revents == 0 || pass(client, server, sent)) &&
               (entries[1].revents == 0 || pass(server, client, received)) &&
               !(cuts && sent >= limit);
    }
    resetAndClose(client);
    resetAndClose(server);
    const std::lock_guard<std::mutex> lock(mutex);
    cut = cut || cuts;
    changed.notify_all();
}

bool CuttingRelay::pass(int from, int to, std::size_t& passed) const {
    std::vector<char> bytes(16384);
    const ssize_t count = ::recv(from, bytes.data(), bytes.size(), 0);
    for (ssize_t done = 0; done < count;) {
        const ssize_t part =
            ::send(to, bytes.data() + done, static_cast<std::size_t>(count - done), MSG_NOSIGNAL);
        if (part <= 0) {
            return false;
        }
        done += part;
        passed += static_cast<std::size_t>(part);
    }
    return count > 0;
}

}  // namespace FaultTest
