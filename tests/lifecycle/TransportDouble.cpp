// The network thread's own class, with the scripted gateway in the place of libcurl: commands wait
// until a test lets the gateway take a turn, and then run on the test's thread.
#include <exception>
#include <utility>

#include "ScriptedGateway.h"
#include "core/network/NetworkTask.h"
#include "network/Transfer.h"
#include "network/Transport.h"

using Lifecycle::ScriptedGateway;

namespace Network {

Transport::Transport() {
    ScriptedGateway::instance().setCommandRunner([this] { return runCommands(); });
}

Transport::~Transport() {
    ScriptedGateway::instance().setCommandRunner({});
}

bool Transport::post(std::function<void()> command) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (!closed) {
        commands.push_back(std::move(command));
    }
    return !closed;
}

/** One command at a time. @return false when there is none */
bool Transport::runCommands() {
    std::function<void()> command;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        if (commands.empty()) {
            return false;
        }
        command = std::move(commands.front());
        commands.erase(commands.begin());
    }
    command();
    return true;
}

void Transport::requestCheck(const boost::shared_ptr<Transfer>& transfer) {
    const boost::shared_ptr<Transport> self = shared_from_this();
    post([self, transfer] { self->check(transfer); });
}

void Transport::check(const boost::shared_ptr<Transfer>& transfer) {
    if (transfer->hasExpired()) {
        ScriptedGateway::instance().end(transfer, NetworkTask::TIMED_OUT);
    }
}

void Transport::start(const boost::shared_ptr<Transfer>& transfer) {
    transfer->open({});
}

void Transport::abandon(const boost::shared_ptr<Transfer>& transfer) {
    ScriptedGateway::instance().disconnect(transfer);
    transfer->abandon();
}

void Transport::requestAbandon(const boost::shared_ptr<Transfer>& transfer) noexcept {
    try {
        const boost::shared_ptr<Transport> self = shared_from_this();
        post([self, transfer] { self->abandon(transfer); });
    } catch (const std::exception&) {
        std::terminate();
    }
}

void Transport::stop() {
    stopping = true;
    while (runCommands()) {
    }
    const std::lock_guard<std::mutex> lock(mutex);
    closed = true;
}

void Transport::setCertificateFile(const std::string& /*path*/) {}

}  // namespace Network
