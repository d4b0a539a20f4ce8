/**
 * @file
 * One exchange with a server, with its retries.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <string>
#include <vector>

#include "core/Export.h"
#include "core/network/HttpRequest.h"
#include "core/network/HttpResponse.h"

namespace Network {

class Exchange;

/**
 * What a `NetworkTaskHolder` runs. All operations are called under the event lock: the requests
 * and response callbacks on the network thread, `onFinished` on the thread that the holder was made
 * for, by default the event thread. The order is
 * `isReadyToPerform`, then per attempt `issueRequest`, `onResponseRecieved` and (by parts)
 * `onBytesReceived`, with `onRetried` between two attempts, then `onFinished` exactly once, unless
 * the holder was cancelled or destroyed: then nothing more is called.
 *
 * May do: anything that does not block. Must not do: block, throw.
 */
class KORVEL_CORE_API NetworkTask {
  public:
    NetworkTask();
    NetworkTask(const NetworkTask&) = delete;
    NetworkTask& operator=(const NetworkTask&) = delete;
    virtual ~NetworkTask();

    /** Asked once, before the first attempt; false ends the task with `NOT_READY`. */
    virtual bool isReadyToPerform() const = 0;

    /** Reserved for ordering; default 1. */
    virtual int getPriority() const;

    /** The request of one attempt; null ends the task with `NO_REQUEST`. */
    virtual boost::shared_ptr<HttpRequest> issueRequest() const = 0;

    /** Default true; reserved. */
    virtual bool needToGatherStatistics() const;

    /**
     * True: the body is handed on piece by piece as it arrives; false (default): it is collected,
     * up to 1 MiB, and handed on in one piece unless it is empty; a larger one ends the attempt
     * with `NO_RESPONSE`.
     */
    virtual bool recieveResponseBodyByParts() const;

    /** The head of the final response has arrived. */
    virtual void onResponseRecieved(boost::shared_ptr<HttpResponse> response) = 0;

    /** A piece of the response's body. */
    virtual void onBytesReceived(const std::vector<unsigned char>& bytes) = 0;

    /**
     * The end.
     * @param code the HTTP status, or one of the negative `Failure` values when there was no
     *             (complete) response
     */
    virtual void onFinished(int code) = 0;

    /** Another attempt follows; default does nothing. */
    virtual void onRetried();

    /**
     * Why the latest attempt that is over failed, in the network layer's words: one line of
     * printable ASCII, at most 200 bytes, such as "Could not resolve host: example.org" or "HTTP
     * status 404". Empty before the first attempt is over and after a status from 200 to 299.
     * Complete when `onFinished` is called. Under the event lock.
     */
    const std::string& getFailureReason() const;

    /** Codes of `onFinished` without a response. */
    enum Failure {
        NO_RESPONSE = -1, /**< no connection, broken connection or no valid answer */
        TIMED_OUT = -2,   /**< the peer let the time-out of the request pass */
        NOT_READY = -3,   /**< `isReadyToPerform` said no */
        NO_REQUEST = -4,  /**< there was no request, or none that can be sent */
    };

  private:
    friend class Exchange;

    std::string failureReason;
};

}  // namespace Network
