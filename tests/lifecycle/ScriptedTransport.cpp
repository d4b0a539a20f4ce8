#include "ScriptedTransport.h"

#include <algorithm>
#include <array>
#include <boost/make_shared.hpp>
#include <exception>
#include <utility>

#include "ScriptedGateway.h"
#include "core/network/NetworkManager.h"
#include "core/network/NetworkTask.h"

namespace Lifecycle {

ScriptedTransport::ScriptedTransport() {
    ScriptedGateway::instance().setCommandRunner([this] { return runCommand(); });
}

ScriptedTransport::~ScriptedTransport() {
    ScriptedGateway::instance().setCommandRunner({});
}

void ScriptedTransport::install() {
    Network::NetworkManager& network = Network::NetworkManager::getInstance();
    if (!boost::dynamic_pointer_cast<ScriptedTransport>(network.getTransport())) {
        network.setTransport(boost::shared_ptr<ScriptedTransport>(new ScriptedTransport));
    }
}

bool ScriptedTransport::post(std::function<void()> command) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (!closed) {
        commands.push_back(std::move(command));
    }
    return !closed;
}

/** @return false when there is none */
bool ScriptedTransport::runCommand() {
    std::function<void()> command;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        if (commands.empty()) {
            return false;
        }
        command = std::move(commands.front());
        commands.pop_front();
    }
    command();
    return true;
}

boost::shared_ptr<Network::Transfer> ScriptedTransport::makeTransfer(
    const boost::shared_ptr<Network::HttpRequest>& request,
    const boost::shared_ptr<Network::TransferListener>& listener) {
    const auto transfer =
        boost::make_shared<ScriptedTransfer>(shared_from_this(), request, listener);
    transfer->startWatchdog();
    return transfer;
}

void ScriptedTransport::stop() {
    stopping = true;
    while (runCommand()) {
    }
    const std::lock_guard<std::mutex> lock(mutex);
    closed = true;
}

ScriptedTransfer::ScriptedTransfer(boost::shared_ptr<ScriptedTransport> owner,
                                   boost::shared_ptr<Network::HttpRequest> what,
                                   boost::shared_ptr<Network::TransferListener> hearer)
    : transport(std::move(owner)),
      request(std::move(what)),
      listener(std::move(hearer)),
      body(request),
      watchdog(request->getTimeoutMs(), [this] {
          if (const boost::shared_ptr<ScriptedTransfer> self = weak_from_this().lock()) {
              transport->post([self] { self->check(); });
          }
      }) {}

void ScriptedTransfer::start() {
    ScriptedGateway::instance().connect(
        {shared_from_this(), listener, request->getUrl(),
         [this](std::string& received, std::size_t most) { return readTo(received, most); }});
}

void ScriptedTransfer::cancel() noexcept {
    try {
        const boost::shared_ptr<ScriptedTransfer> self = shared_from_this();
        transport->post([self] {
            ScriptedGateway::instance().disconnect(self);
            self->forget();
        });
    } catch (const std::exception&) {
        std::terminate();
    }
}

bool ScriptedTransfer::readTo(std::string& received, std::size_t most) {
    std::array<char, 16384> piece;
    for (;;) {
        const std::size_t room = std::min(piece.size(), most);
        const std::size_t size = room > 0 ? readBody(piece.data(), room) : 0;
        if (size == 0) {
            return room > 0 && !paused;
        }
        received.append(piece.data(), size);
        most -= size;
    }
}

/** @return 0 at the end of the body and, with `paused` set, when there is nothing yet */
std::size_t ScriptedTransfer::readBody(char* data, std::size_t size) {
    std::size_t count = 0;
    paused = body.read(data, size, count) == Network::RequestBody::State::NOTHING_YET;
    if (paused) {
        watchdog.pause();
    } else {
        watchdog.progress();
    }
    return count;
}

void ScriptedTransfer::check() {
    if (watchdog.hasExpired()) {
        ScriptedGateway::instance().end(shared_from_this(), Network::NetworkTask::TIMED_OUT);
    }
}

void ScriptedTransfer::end(const Network::TransferEnd& how) {
    const boost::shared_ptr<Network::TransferListener> hearer = listener;
    forget();
    if (hearer) {
        hearer->onTransferEnd(how);
    }
}

void ScriptedTransfer::forget() {
    watchdog.stop();
    listener.reset();
}

}  // namespace Lifecycle
