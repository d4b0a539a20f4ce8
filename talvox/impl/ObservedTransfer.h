/**
 * @file
 * Reports an attempt of a session's request to the session's observer.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>

#include "core/network/TransferTrace.h"
#include "talvox/SessionObserver.h"

namespace Talvox {

/**
 * Stands between a transport and the listener of one attempt. What changes the session is reported
 * under the same hold of the event lock in which it is delivered, so the order of the reports is
 * the order in which the session was changed.
 */
class ObservedTransfer : public Network::TransferListener, public Network::TransferTrace {
  public:
    /** @param attemptNumber from 1 */
    ObservedTransfer(boost::shared_ptr<SessionObserver> sessionObserver, int attemptNumber,
                     boost::shared_ptr<Network::TransferListener> receiver);

    bool onTransferHead(const boost::shared_ptr<Network::HttpResponse>& response) override;
    bool onTransferBytes(const unsigned char* bytes, std::size_t size) override;
    void onTransferEnd(const Network::TransferEnd& how) override;

    void onTransferConnection(const Network::TransferConnection& connection) noexcept override;
    void onTransferPiece(std::size_t size) noexcept override;

  private:
    const boost::shared_ptr<SessionObserver> observer;
    const int attempt;
    const boost::shared_ptr<Network::TransferListener> listener;
};

}  // namespace Talvox
