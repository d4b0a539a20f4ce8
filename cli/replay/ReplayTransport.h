#pragma once

#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <deque>
#include <functional>
#include <mutex>
#include <string>
#include <vector>

#include "core/network/Transport.h"

namespace Cli {

/**
 * Answers requests as a recording says, without a network and without a thread: commands wait until
 * `runCommands`, answers come when the replay delivers them. An attempt that the session has given
 * up, or never made, receives nothing.
 */
class ReplayTransport : public Network::Transport,
                        public boost::enable_shared_from_this<ReplayTransport> {
  public:
    /** @return whether there were any */
    bool runCommands();

    /** @param attempt from 1 */
    void deliverHead(int attempt, const boost::shared_ptr<Network::HttpResponse>& head);
    void deliverBody(int attempt, std::size_t size);
    void deliverEnd(int attempt, const Network::TransferEnd& how);

    bool post(std::function<void()> command) override;
    boost::shared_ptr<Network::Transfer> makeTransfer(
        const boost::shared_ptr<Network::HttpRequest>& request,
        const boost::shared_ptr<Network::TransferListener>& listener) override;
    void stop() override;
    bool isStopping() const override { return stopping; }
    void setCertificateFile(const std::string& /*path*/) override {}

  private:
    class ReplayTransfer;

    boost::shared_ptr<ReplayTransfer> find(int attempt) const;

    std::mutex mutex;
    std::deque<std::function<void()>> commands;
    /** Under the event lock. */
    std::vector<boost::shared_ptr<ReplayTransfer>> transfers;
    bool stopping = false;
};

}  // namespace Cli
