#include "Stillness.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <sys/socket.h>

#include <algorithm>
#include <boost/make_shared.hpp>
#include <chrono>
#include <filesystem>
#include <future>
#include <map>
#include <string>
#include <thread>

#include "LiveCounts.h"
#include "core/network/NetworkTaskHolder.h"
#include "pal/kd_event.h"

namespace FaultTest {

namespace {

using TestSupport::ScriptedHttpServer;

constexpr std::chrono::seconds LONGEST_WAIT{30};

/**
 * A request with a port that cannot be. That shows where transfers are made to move on, so when it
 * has failed, the network thread has looked at all others as well. Nothing is sent.
 */
class BarrierTask : public Network::NetworkTask {
  public:
    bool isReadyToPerform() const override { return true; }
    boost::shared_ptr<Network::HttpRequest> issueRequest() const override {
        return Network::HttpRequest::create("http://127.0.0.1:99999/", "GET", 0, false);
    }
    void onResponseRecieved(boost::shared_ptr<Network::HttpResponse>) override {}
    void onBytesReceived(const std::vector<unsigned char>&) override {}
    void onFinished(int) override { passed.set_value(); }

    bool wait() { return passed.get_future().wait_for(LONGEST_WAIT) == std::future_status::ready; }

  private:
    std::promise<void> passed;
};

bool passNetworkThread() {
    const auto barrier = boost::make_shared<BarrierTask>();
    Network::NetworkTaskHolder holder(Network::NetworkTaskHolder::EndThread::NETWORK);
    holder.submitNoRetries(barrier);
    return barrier->wait();
}

unsigned short portOf(int (*ask)(int, sockaddr*, socklen_t*), int descriptor) {
    sockaddr_in address{};
    socklen_t length = sizeof(address);
    if (ask(descriptor, reinterpret_cast<sockaddr*>(&address), &length) != 0 ||
        address.sin_family != AF_INET) {
        return 0;
    }
    return ntohs(address.sin_port);
}

bool isConnecting(int descriptor) {
    tcp_info info{};
    socklen_t length = sizeof(info);
    return ::getsockopt(descriptor, IPPROTO_TCP, TCP_INFO, &info, &length) == 0 &&
           info.tcpi_state == TCP_SYN_SENT;
}

bool hasUnsentBytes(int descriptor) {
    int unsent = 0;
    return ::ioctl(descriptor, TIOCOUTQ, &unsent) == 0 && unsent > 0;
}

bool knowsTheEnd(int descriptor) {
    pollfd entry{descriptor, POLLIN | POLLRDHUP, 0};
    return ::poll(&entry, 1, 0) > 0 && (entry.revents & (POLLRDHUP | POLLHUP | POLLERR)) != 0;
}

/** Whether nothing is on its way to or from the library over this descriptor. */
bool isSettled(int descriptor, unsigned short serverPort,
               const std::map<unsigned short, bool>& peers) {
    if (isConnecting(descriptor)) {
        return false;
    }
    if (portOf(&::getpeername, descriptor) != serverPort) {
        return true;
    }
    const auto peer = peers.find(portOf(&::getsockname, descriptor));
    if (peer == peers.end()) {
        return knowsTheEnd(descriptor);
    }
    return peer->second || !hasUnsentBytes(descriptor);
}

/** The open sockets, each with a number of its own, which a later one on the descriptor lacks. */
std::map<int, std::string> listSockets() {
    std::map<int, std::string> sockets;
    std::error_code ignored;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd", ignored)) {
        const std::string target = std::filesystem::read_symlink(entry.path(), ignored).string();
        if (target.rfind("socket:", 0) == 0) {
            sockets[std::stoi(entry.path().filename().string())] = target;
        }
    }
    return sockets;
}

bool areAllSettled(const ScriptedHttpServer& server, const std::map<int, std::string>& sockets) {
    const std::map<unsigned short, bool> peers = server.getPeers();
    return std::all_of(sockets.begin(), sockets.end(), [&](const auto& socket) {
        return isSettled(socket.first, server.getPort(), peers);
    });
}

bool isStill(const ScriptedHttpServer& server) {
    const std::size_t before = server.getActivity();
    const std::map<int, std::string> sockets = listSockets();
    if (!server.isIdle() || !areAllSettled(server, sockets) || LiveCounts::countTasks() > 0) {
        return false;
    }
    // The two threads give each other work.
    for (int round = 0; round < 3; ++round) {
        if (!passNetworkThread()) {
            return false;
        }
        kdDrainEventsKOR();
    }
    // A connection that was begun meanwhile may have been refused since the thread looked at it.
    return passNetworkThread() && server.isIdle() && listSockets() == sockets &&
           areAllSettled(server, sockets) && LiveCounts::countTasks() == 0 &&
           server.getActivity() == before;
}

}  // namespace

bool waitForStillness(const ScriptedHttpServer& server) {
    const auto deadline = std::chrono::steady_clock::now() + LONGEST_WAIT;
    while (!isStill(server)) {
        if (std::chrono::steady_clock::now() > deadline) {
            return false;
        }
        std::this_thread::yield();
    }
    return true;
}

}  // namespace FaultTest
