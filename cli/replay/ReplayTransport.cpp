#include "ReplayTransport.h"

#include <boost/make_shared.hpp>
#include <utility>

#include "core/util/EventLock.h"

namespace Cli {

/** An attempt; under the event lock. */
class ReplayTransport::ReplayTransfer : public Network::Transfer {
  public:
    explicit ReplayTransfer(boost::shared_ptr<Network::TransferListener> receiver)
        : listener(std::move(receiver)) {}

    void start() override {}
    void cancel() noexcept override {
        const Util::EventLock lock;
        listener.reset();
    }

    boost::shared_ptr<Network::TransferListener> listener;
};

bool ReplayTransport::runCommands() {
    bool hadAny = false;
    for (;;) {
        std::function<void()> command;
        {
            const std::lock_guard<std::mutex> lock(mutex);
            if (commands.empty()) {
                return hadAny;
            }
            command = std::move(commands.front());
            commands.pop_front();
        }
        hadAny = true;
        command();
    }
}

boost::shared_ptr<ReplayTransport::ReplayTransfer> ReplayTransport::find(int attempt) const {
    const auto index = static_cast<std::size_t>(attempt) - 1;
    return attempt > 0 && index < transfers.size() && transfers[index]->listener
               ? transfers[index]
               : boost::shared_ptr<ReplayTransfer>();
}

void ReplayTransport::deliverHead(int attempt,
                                  const boost::shared_ptr<Network::HttpResponse>& head) {
    const Util::EventLock lock;
    if (const auto transfer = find(attempt)) {
        const auto listener = transfer->listener;
        listener->onTransferHead(head);
    }
}

void ReplayTransport::deliverBody(int attempt, std::size_t size) {
    const Util::EventLock lock;
    if (const auto transfer = find(attempt)) {
        const auto listener = transfer->listener;
        const std::vector<unsigned char> bytes(size);
        listener->onTransferBytes(bytes.data(), bytes.size());
    }
}

void ReplayTransport::deliverEnd(int attempt, const Network::TransferEnd& how) {
    const Util::EventLock lock;
    if (const auto transfer = find(attempt)) {
        const auto listener = std::move(transfer->listener);
        transfer->listener.reset();
        listener->onTransferEnd(how);
    }
}

bool ReplayTransport::post(std::function<void()> command) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (!stopping) {
        commands.push_back(std::move(command));
    }
    return !stopping;
}

boost::shared_ptr<Network::Transfer> ReplayTransport::makeTransfer(
    const boost::shared_ptr<Network::HttpRequest>& /*request*/,
    const boost::shared_ptr<Network::TransferListener>& listener) {
    transfers.push_back(boost::make_shared<ReplayTransfer>(listener));
    return transfers.back();
}

void ReplayTransport::stop() {
    runCommands();
    const std::lock_guard<std::mutex> lock(mutex);
    stopping = true;
}

}  // namespace Cli
