/**
 * @file
 * What can be observed of a transfer beyond its answer.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <cstdint>

#include "core/Export.h"
#include "core/network/HttpRequest.h"
#include "core/network/Transport.h"

namespace Network {

/** How an attempt got its connection. Times are nanoseconds from the beginning of the attempt. */
struct TransferConnection {
    /** In place of the time of a stage that was not needed or not reached. */
    static constexpr int64_t NONE = -1;

    bool isNew = false;         /**< false for a kept connection */
    int64_t lookupNs = NONE;    /**< the name was looked up */
    int64_t connectedNs = NONE; /**< the connection was made */
    int64_t tlsNs = NONE;       /**< TLS was negotiated */
};

/**
 * A `TransferListener` that also derives from this class is notified of the stages of its transfer,
 * if the transport knows them. Called on the transport's thread without the event lock, before the
 * end of the transfer. Must not block or throw.
 */
class KORVEL_CORE_API TransferTrace {
  public:
    virtual ~TransferTrace();

    /** The connection is ready for the request, or the attempt has failed earlier. At most once. */
    virtual void onTransferConnection(const TransferConnection& connection) noexcept = 0;

    /** A piece of the body has been handed to the network. @param size in bytes, above 0 */
    virtual void onTransferPiece(std::size_t size) noexcept = 0;
};

/** A `NetworkTask` that also derives from this class can observe the transfers of its attempts. */
class KORVEL_CORE_API TransferTap {
  public:
    virtual ~TransferTap();

    /**
     * Called once for each attempt, under the event lock, after `NetworkTask::issueRequest`.
     * @param listener receives the transfer
     * @return what receives it instead and forwards every call to `listener`; or `listener`
     * @throws std::bad_alloc
     */
    virtual boost::shared_ptr<TransferListener> tapTransfer(
        const HttpRequest& request, const boost::shared_ptr<TransferListener>& listener) = 0;
};

}  // namespace Network
