#include "talvox/impl/ObservedTransfer.h"

#include <utility>

#include "core/util/EventLock.h"

namespace Talvox {

ObservedTransfer::ObservedTransfer(boost::shared_ptr<SessionObserver> sessionObserver,
                                   int attemptNumber,
                                   boost::shared_ptr<Network::TransferListener> receiver)
    : observer(std::move(sessionObserver)), attempt(attemptNumber), listener(std::move(receiver)) {}

bool ObservedTransfer::onTransferHead(const boost::shared_ptr<Network::HttpResponse>& response) {
    const Util::EventLock lock;
    observer->onHead(attempt, *response);
    return listener->onTransferHead(response);
}

bool ObservedTransfer::onTransferBytes(const unsigned char* bytes, std::size_t size) {
    const Util::EventLock lock;
    observer->onBody(attempt, size);
    return listener->onTransferBytes(bytes, size);
}

void ObservedTransfer::onTransferEnd(const Network::TransferEnd& how) {
    const Util::EventLock lock;
    observer->onAttemptEnd(attempt, how);
    listener->onTransferEnd(how);
}

void ObservedTransfer::onTransferConnection(
    const Network::TransferConnection& connection) noexcept {
    observer->onConnection(attempt, connection);
}

void ObservedTransfer::onTransferPiece(std::size_t size) noexcept {
    observer->onSent(attempt, size);
}

}  // namespace Talvox
