/**
 * @file
 * The seam between network tasks and what carries their requests.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <functional>
#include <string>

#include "core/Export.h"
#include "core/network/HttpRequest.h"
#include "core/network/HttpResponse.h"

namespace Network {

/** How a transfer ended. */
struct TransferEnd {
    int code = 0;       /**< as for `NetworkTask::onFinished` */
    std::string reason; /**< why there was no complete response; empty when there was one */
};

/**
 * Hears of one transfer: at most one head, then bytes of the body, and one end, which is the last
 * call. All operations are called on the transport's thread without any lock of its own, and none
 * throws.
 */
class KORVEL_CORE_API TransferListener {
  public:
    virtual ~TransferListener();

    /** @return false to end the transfer */
    virtual bool onTransferHead(const boost::shared_ptr<HttpResponse>& response) = 0;
    /** @return false to end the transfer */
    virtual bool onTransferBytes(const unsigned char* bytes, std::size_t size) = 0;
    /** The transfer is over, with or without an answer. */
    virtual void onTransferEnd(const TransferEnd& how) = 0;
};

/** One attempt of a request; made by its transport, which keeps it alive until it is over. */
class KORVEL_CORE_API Transfer {
  public:
    virtual ~Transfer();

    /**
     * Begins, once. However it goes, the listener hears of the end, unless `cancel` comes first.
     * The transport's thread only.
     */
    virtual void start() = 0;

    /**
     * Ends it without a word to the listener; calls that are under way may still arrive. Any
     * thread, also before `start` or after the end; does not block, and cannot fail.
     */
    virtual void cancel() noexcept = 0;
};

/**
 * Carries requests on a thread of its own. The engine's transport is libcurl's; another one stands
 * in for the network in tests. Holds no lock of its own while a command or a listener runs, so
 * these may take the event lock.
 */
class KORVEL_CORE_API Transport {
  public:
    virtual ~Transport();

    /**
     * Has a command run on the transport's thread, behind those before it. Any thread; does not
     * block.
     * @return false when the command will not run: the transport is closed, or the system has no
     *         thread or descriptors for it at the moment; the next call tries again
     */
    virtual bool post(std::function<void()> command) = 0;

    /**
     * Makes an attempt of a request, to be started soon: from now on the transport measures how
     * long the peer keeps us waiting, and ends the transfer with `NetworkTask::TIMED_OUT` when that
     * exceeds the request's time-out. Under the event lock.
     * @throws std::bad_alloc
     */
    virtual boost::shared_ptr<Transfer> makeTransfer(
        const boost::shared_ptr<HttpRequest>& request,
        const boost::shared_ptr<TransferListener>& listener) = 0;

    /**
     * Ends all transfers, with `NetworkTask::NO_RESPONSE`, and the thread. Waits for that, a
     * bounded time; the event lock, where the caller holds it, is lent to the thread meanwhile.
     * Afterwards `post` takes nothing.
     */
    virtual void stop() = 0;

    /** From the beginning of `stop` on. Any thread. */
    virtual bool isStopping() const = 0;

    /** As `NetworkManager::setCertificateFile`. */
    virtual void setCertificateFile(const std::string& path) = 0;
};

}  // namespace Network
