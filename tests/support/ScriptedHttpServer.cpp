#include "support/ScriptedHttpServer.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <strings.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <stdexcept>

namespace TestSupport {

namespace {

/** Binds to a port, 0 for any; tells which. */
int openLoopbackSocket(unsigned short& port) {
    const int descriptor = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    address.sin_port = htons(port);
    socklen_t length = sizeof(address);
    auto* generic = reinterpret_cast<sockaddr*>(&address);
    // Connections of a server that has gone do not keep its port from the next one.
    // Where any port will do, the option must not let us share one, so it follows the binding.
    const int reuse = 1;
    const bool early = port != 0;
    const auto shareOldPort = [descriptor, &reuse] {
        return ::setsockopt(descriptor, SOL_SOCKET, SO_REUSEADDR, &reuse, sizeof(reuse)) == 0;
    };
    if (descriptor < 0 || (early && !shareOldPort()) || ::bind(descriptor, generic, length) != 0 ||
        !shareOldPort() || ::getsockname(descriptor, generic, &length) != 0) {
        throw std::runtime_error("no loopback socket for the test server");
    }
    port = ntohs(address.sin_port);
    return descriptor;
}

/**
 * The same, but bound to its port for good: where the system chose the port, a socket loses it when
 * it stops listening.
 */
int openListener(unsigned short& port) {
    const int first = openLoopbackSocket(port);
    const int listener = openLoopbackSocket(port);
    ::close(first);
    return listener;
}

/** Makes `close` reset the connection instead of ending it in good order. */
void resetOnClose(int socket) {
    const linger abort{1, 0};
    ::setsockopt(socket, SOL_SOCKET, SO_LINGER, &abort, sizeof(abort));
}

/** What `poll` says now. */
short lookAt(int socket) {
    pollfd entry{socket, POLLIN | POLLRDHUP, 0};
    return ::poll(&entry, 1, 0) > 0 ? entry.revents : static_cast<short>(0);
}

std::string loopbackUrl(unsigned short port) {
    return "http://127.0.0.1:" + std::to_string(port);
}

std::string trim(const std::string& text) {
    const std::size_t first = text.find_first_not_of(" \t");
    const std::size_t last = text.find_last_not_of(" \t\r\n");
    return first == std::string::npos ? std::string() : text.substr(first, last - first + 1);
}

}  // namespace

std::string ScriptedHttpServer::Request::line() const {
    return head.substr(0, head.find("\r\n"));
}

std::optional<std::string> ScriptedHttpServer::Request::header(const std::string& name) const {
    std::size_t start = head.find("\r\n");
    while (start != std::string::npos && start + 2 < head.size()) {
        start += 2;
        const std::size_t end = head.find("\r\n", start);
        const std::string field = head.substr(start, end - start);
        const std::size_t colon = field.find(':');
        if (colon == name.size() && ::strncasecmp(field.c_str(), name.c_str(), colon) == 0) {
            return trim(field.substr(colon + 1));
        }
        start = end;
    }
    return std::nullopt;
}

template <typename Change>
void ScriptedHttpServer::changeRequest(std::size_t index, Change change) {
    const std::lock_guard<std::mutex> lock(mutex);
    change(requests[index]);
    ++activity;
    changed.notify_all();
}

/** One connection: cuts the stream into requests and plays the answers. Its own thread only. */
class ScriptedHttpServer::Connection {
  public:
    Connection(ScriptedHttpServer& owner, std::size_t number, int descriptor)
        : server(owner), index(number), socket(descriptor) {}

    void run() {
        while (serveOne()) {
        }
    }

  private:
    bool serveOne() {
        std::string head;
        if (!readUntil("\r\n\r\n", head)) {
            return false;
        }
        Request request;
        request.head = head;
        bodySize = 0;
        acted = false;
        open = true;
        requestIndex = server.addRequest(index, head, answer);
        if (answer.pauseReading && !server.waitForRelease(index)) {
            return false;
        }
        actIfDue(false);
        if (open) {
            const std::string coding = request.header("Transfer-Encoding").value_or("");
            const std::string length = request.header("Content-Length").value_or("0");
            const bool whole = coding == "chunked"
                                   ? readChunks()
                                   : readBody(std::strtoul(length.c_str(), nullptr, 10));
            if (open && whole) {
                server.changeRequest(requestIndex, [](Request& record) { record.complete = true; });
                actIfDue(true);
            }
            open = open && whole;
        }
        return open;
    }

    bool readChunks() {
        std::string line;
        while (open && readUntil("\r\n", line)) {
            const std::size_t size = std::strtoul(line.c_str(), nullptr, 16);
            if (size == 0) {
                return readUntil("\r\n", line);
            }
            server.changeRequest(requestIndex,
                                 [size](Request& record) { record.chunkSizes.push_back(size); });
            if (!readBody(size) || !readUntil("\r\n", line)) {
                return false;
            }
        }
        return false;
    }

    bool readBody(std::size_t size) {
        while (open && size > 0) {
            if (!mayRead() || (buffer.empty() && !receive())) {
                return false;
            }
            std::size_t part = std::min(size, buffer.size());
            if (answer.readAtOnce > 0) {
                part = std::min(part, answer.readAtOnce - bodySize % answer.readAtOnce);
            }
            server.changeRequest(requestIndex, [this, part](Request& record) {
                record.body.append(buffer, 0, part);
            });
            bodySize += part;
            buffer.erase(0, part);
            size -= part;
            actIfDue(false);
        }
        return open;
    }

    bool mayRead() {
        const bool atPiece = answer.readAtOnce > 0 && bodySize % answer.readAtOnce == 0;
        return !atPiece || server.waitForRelease(index);
    }

    bool readUntil(const std::string& mark, std::string& text) {
        std::size_t found = buffer.find(mark);
        while (found == std::string::npos) {
            // What has been searched is not searched again: heads may be a megabyte long.
            const std::size_t searched = buffer.size() - std::min(buffer.size(), mark.size());
            if (!receive()) {
                return false;
            }
            found = buffer.find(mark, searched);
        }
        text = buffer.substr(0, found + mark.size());
        buffer.erase(0, found + mark.size());
        return true;
    }

    bool receive() {
        char bytes[16384];
        // In two steps: what has arrived stays visible to others until this thread is at work.
        server.setListens(index, true);
        pollfd entry{socket, POLLIN, 0};
        ::poll(&entry, 1, -1);
        server.setListens(index, false);
        // Slow readers leave the rest with the system.
        const std::size_t most =
            answer.readAtOnce > 0 ? std::min(answer.readAtOnce, sizeof(bytes)) : sizeof(bytes);
        const ssize_t count = ::recv(socket, bytes, most, 0);
        if (count > 0) {
            buffer.append(bytes, static_cast<std::size_t>(count));
        }
        return count > 0;
    }

    void actIfDue(bool complete) {
        const bool due =
            complete || (answer.actAfter != Answer::WHOLE_BODY && bodySize >= answer.actAfter);
        if (acted || !due) {
            return;
        }
        acted = true;
        for (const std::string& piece : answer.pieces) {
            if ((answer.needsRelease && !server.waitForRelease(index)) || !send(piece)) {
                open = false;
                return;
            }
        }
        finish();
    }

    bool send(const std::string& bytes) {
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

    void finish() {
        if (answer.end == Answer::End::RESET) {
            resetOnClose(socket);
            open = false;
        } else if (answer.end == Answer::End::CLOSE) {
            ::shutdown(socket, SHUT_WR);
            // Unread bytes would turn the close into a reset, which may overtake the answer.
            while (!answer.pieces.empty() && receive()) {
                buffer.clear();
            }
            open = false;
        }
    }

    ScriptedHttpServer& server;
    const std::size_t index;
    const int socket;
    std::string buffer;
    Answer answer;
    std::size_t requestIndex = 0;
    std::size_t bodySize = 0;
    bool acted = false;
    bool open = true;
};

ScriptedHttpServer::ScriptedHttpServer(unsigned short fixedPort)
    : port(fixedPort), listener(openListener(port)), defaultAnswer(Answer::status(200)) {
    if (::listen(listener, 64) != 0) {
        throw std::runtime_error("the test server cannot listen");
    }
    acceptor = std::thread([this] { acceptLoop(); });
}

ScriptedHttpServer::~ScriptedHttpServer() {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        stopping = true;
        ::shutdown(listener, SHUT_RDWR);
        for (const auto& entry : peers) {
            ::shutdown(entry.second.socket, SHUT_RDWR);
        }
        changed.notify_all();
    }
    acceptor.join();
    for (std::thread& worker : workers) {
        worker.join();
    }
    ::close(listener);
}

std::string ScriptedHttpServer::getUrl() const {
    return loopbackUrl(port);
}

void ScriptedHttpServer::script(const std::vector<Answer>& more) {
    const std::lock_guard<std::mutex> lock(mutex);
    answers.insert(answers.end(), more.begin(), more.end());
}

void ScriptedHttpServer::setDefaultAnswer(const Answer& answer) {
    const std::lock_guard<std::mutex> lock(mutex);
    defaultAnswer = answer;
}

void ScriptedHttpServer::release(std::size_t count) {
    const std::lock_guard<std::mutex> lock(mutex);
    released += count;
    changed.notify_all();
}

void ScriptedHttpServer::resetConnections(std::size_t count) {
    const std::lock_guard<std::mutex> lock(mutex);
    toReset = count;
}

// Their threads find the end of what they read, and close.
void ScriptedHttpServer::resetAll() {
    for (const auto& entry : peers) {
        resetOnClose(entry.second.socket);
        ::shutdown(entry.second.socket, SHUT_RD);
    }
    changed.notify_all();
}

void ScriptedHttpServer::dropConnections() {
    const std::lock_guard<std::mutex> lock(mutex);
    ++activity;
    resetAll();
}

void ScriptedHttpServer::goAway() {
    const std::lock_guard<std::mutex> lock(mutex);
    away = true;
    ++activity;
    // A listening socket is bound for good, but listens no longer.
    ::shutdown(listener, SHUT_RDWR);
    resetAll();
}

void ScriptedHttpServer::comeBack() {
    const std::lock_guard<std::mutex> lock(mutex);
    away = false;
    ++activity;
    if (::listen(listener, 64) != 0) {
        throw std::runtime_error("the test server cannot listen again");
    }
    changed.notify_all();
}

void ScriptedHttpServer::narrow() {
    const int segment = 1000;
    const int window = 4096;
    ::setsockopt(listener, IPPROTO_TCP, TCP_MAXSEG, &segment, sizeof(segment));
    ::setsockopt(listener, SOL_SOCKET, SO_RCVBUF, &window, sizeof(window));
}

std::size_t ScriptedHttpServer::getRequestCount() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return requests.size();
}

ScriptedHttpServer::Request ScriptedHttpServer::getRequest(std::size_t index) const {
    const std::lock_guard<std::mutex> lock(mutex);
    return index < requests.size() ? requests[index] : Request();
}

std::size_t ScriptedHttpServer::getConnectionCount() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return accepted;
}

template <typename Condition>
bool ScriptedHttpServer::waitUntil(std::chrono::milliseconds timeout, Condition condition) const {
    std::unique_lock<std::mutex> lock(mutex);
    return changed.wait_for(lock, timeout, condition);
}

bool ScriptedHttpServer::waitForRequest(std::size_t count,
                                        std::chrono::milliseconds timeout) const {
    return waitUntil(timeout, [this, count] {
        return static_cast<std::size_t>(
                   std::count_if(requests.begin(), requests.end(),
                                 [](const Request& request) { return request.complete; })) >= count;
    });
}

bool ScriptedHttpServer::waitForHead(std::size_t count, std::chrono::milliseconds timeout) const {
    return waitUntil(timeout, [this, count] { return requests.size() >= count; });
}

bool ScriptedHttpServer::waitForBody(std::size_t index, std::size_t bytes,
                                     std::chrono::milliseconds timeout) const {
    return waitUntil(timeout, [this, index, bytes] {
        return index < requests.size() && requests[index].body.size() >= bytes;
    });
}

bool ScriptedHttpServer::waitForClosed(std::size_t count, std::chrono::milliseconds timeout) const {
    return waitUntil(timeout, [this, count] { return ended >= count; });
}

bool ScriptedHttpServer::isQuiet(const Peer& peer) const {
    const short seen = lookAt(peer.socket);
    int unsent = 0;
    // What a reset has stopped stays unsent.
    const bool delivered = (seen & (POLLERR | POLLHUP)) != 0 ||
                           (::ioctl(peer.socket, TIOCOUTQ, &unsent) == 0 && unsent == 0);
    return delivered && (peer.isHeld ? released == 0 : peer.listens && seen == 0);
}

bool ScriptedHttpServer::isIdle() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return acceptorWaits && (away || lookAt(listener) == 0) &&
           std::all_of(peers.begin(), peers.end(),
                       [this](const auto& entry) { return isQuiet(entry.second); });
}

std::size_t ScriptedHttpServer::getActivity() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return activity;
}

std::map<unsigned short, bool> ScriptedHttpServer::getPeers() const {
    const std::lock_guard<std::mutex> lock(mutex);
    std::map<unsigned short, bool> ports;
    for (const auto& entry : peers) {
        ports[entry.second.port] = entry.second.isHeld;
    }
    return ports;
}

/** @return false when the server ends */
bool ScriptedHttpServer::waitForConnection() {
    std::unique_lock<std::mutex> lock(mutex);
    acceptorWaits = true;
    changed.wait(lock, [this] { return stopping || !away; });
    lock.unlock();
    pollfd entry{listener, POLLIN, 0};
    ::poll(&entry, 1, -1);
    lock.lock();
    acceptorWaits = away;
    return !stopping;
}

void ScriptedHttpServer::acceptLoop() {
    while (waitForConnection()) {
        sockaddr_in address{};
        socklen_t length = sizeof(address);
        const int socket =
            ::accept4(listener, reinterpret_cast<sockaddr*>(&address), &length, SOCK_CLOEXEC);
        if (socket >= 0) {
            welcome(socket, ntohs(address.sin_port));
        }
    }
}

void ScriptedHttpServer::welcome(int socket, unsigned short peerPort) {
    const std::lock_guard<std::mutex> lock(mutex);
    const std::size_t index = accepted++;
    ++activity;
    changed.notify_all();
    if (stopping || away || toReset > 0) {
        toReset -= std::min<std::size_t>(toReset, 1);
        resetOnClose(socket);
        ::close(socket);
        ++ended;
        return;
    }
    const int on = 1;
    ::setsockopt(socket, IPPROTO_TCP, TCP_NODELAY, &on, sizeof(on));
    peers[index] = {socket, peerPort, false, false};
    workers.emplace_back([this, index, socket] { serve(index, socket); });
}

void ScriptedHttpServer::serve(std::size_t index, int socket) {
    Connection(*this, index, socket).run();
    const std::lock_guard<std::mutex> lock(mutex);
    peers.erase(index);
    ::close(socket);
    ++ended;
    ++activity;
    changed.notify_all();
}

void ScriptedHttpServer::setListens(std::size_t connection, bool value) {
    const std::lock_guard<std::mutex> lock(mutex);
    peers[connection].listens = value;
    // Coming is no activity, going is: something has arrived.
    activity += value ? 0 : 1;
}

std::size_t ScriptedHttpServer::addRequest(std::size_t connection, const std::string& head,
                                           Answer& answer) {
    const std::lock_guard<std::mutex> lock(mutex);
    answer = answers.empty() ? defaultAnswer : answers.front();
    if (!answers.empty()) {
        answers.pop_front();
    }
    Request request;
    request.connection = connection;
    request.head = head;
    requests.push_back(request);
    ++activity;
    changed.notify_all();
    return requests.size() - 1;
}

bool ScriptedHttpServer::waitForRelease(std::size_t connection) {
    std::unique_lock<std::mutex> lock(mutex);
    peers[connection].isHeld = true;
    changed.wait(lock, [this] { return stopping || away || released > 0; });
    peers[connection].isHeld = false;
    ++activity;
    if (stopping || away) {
        return false;
    }
    --released;
    return true;
}

RefusingPort::RefusingPort() : socket(openLoopbackSocket(port)) {}

RefusingPort::~RefusingPort() {
    ::close(socket);
}

std::string RefusingPort::getUrl() const {
    return loopbackUrl(port);
}

}  // namespace TestSupport
