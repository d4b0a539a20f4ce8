/**
 * @file
 * Requests for which nobody waits.
 */
#pragma once

#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <string>

#include "core/network/NetworkTaskHolder.h"
#include "talvox/Talvox.h"
#include "talvox/impl/RecognizeRequest.h"

/**
 * Keeps one request alive until it is over: lives in the facade's list of running task holders,
 * and removes itself. Used under the event lock.
 */
class SelfFinishingTaskHolder : public Network::NetworkTaskHolder,
                                public boost::enable_shared_from_this<SelfFinishingTaskHolder> {
  public:
    /** Submits a request, with one attempt. Its results are thrown away. */
    static void submitLog(Talvox::Talvox& facade,
                          const boost::shared_ptr<Talvox::RecognizeRequest>& request);

    /** The request's callback: the end of the request, and of this holder. */
    void selfFinish(const boost::shared_ptr<const Talvox::RecognitionResults>& results,
                    const std::string& text);
};
