/**
 * @file
 * The request that carries one record.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <functional>
#include <string>
#include <vector>

#include "core/network/NetworkTask.h"

namespace LogCollector {

/**
 * Sends a record to the address that the collector has at the time of each attempt. Only the
 * status 200 is a success.
 */
class LogCollectorNetworkTask : public Network::NetworkTask {
  public:
    using Callback = std::function<void(bool success, const std::string& record, int status)>;

    static const std::string TAG;

    static constexpr int TIMEOUT_MS = 30000;

    /** The network layer sends no longer head of a request than about 1 MiB. */
    static constexpr std::size_t MAX_ENCODED_BYTES = 1000000;

    /** A record that no request can carry, whatever the address. */
    static bool isTooLong(const std::string& record);

    LogCollectorNetworkTask(std::string recordText, Callback completion);

    bool isReadyToPerform() const override;
    boost::shared_ptr<Network::HttpRequest> issueRequest() const override;
    void onResponseRecieved(boost::shared_ptr<Network::HttpResponse> response) override;
    void onBytesReceived(const std::vector<unsigned char>& bytes) override;
    void onFinished(int status) override;

  private:
    const std::string record;
    const Callback callback;
};

}  // namespace LogCollector
