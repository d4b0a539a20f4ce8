/**
 * @file
 * A transport without a thread and without a network.
 */
#pragma once

#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <deque>
#include <functional>
#include <mutex>
#include <string>

#include "core/network/Transport.h"
#include "network/RequestBody.h"
#include "network/Watchdog.h"

namespace Lifecycle {

/**
 * Commands wait until a test lets the scripted gateway take a turn, and then run on the test's
 * thread. Requests go to that gateway.
 */
class ScriptedTransport : public Network::Transport,
                          public boost::enable_shared_from_this<ScriptedTransport> {
  public:
    /** Has the network manager use one, unless it does so. */
    static void install();

    ~ScriptedTransport() override;
    ScriptedTransport(const ScriptedTransport&) = delete;
    ScriptedTransport& operator=(const ScriptedTransport&) = delete;

    bool post(std::function<void()> command) override;
    boost::shared_ptr<Network::Transfer> makeTransfer(
        const boost::shared_ptr<Network::HttpRequest>& request,
        const boost::shared_ptr<Network::TransferListener>& listener) override;
    void stop() override;
    bool isStopping() const override { return stopping; }
    void setCertificateFile(const std::string& /*path*/) override {}

  private:
    ScriptedTransport();

    bool runCommand();

    std::mutex mutex;
    std::deque<std::function<void()>> commands;
    bool stopping = false;
    bool closed = false;
};

/** One attempt of a request, which the scripted gateway serves. */
class ScriptedTransfer : public Network::Transfer,
                         public boost::enable_shared_from_this<ScriptedTransfer> {
  public:
    ScriptedTransfer(boost::shared_ptr<ScriptedTransport> transport,
                     boost::shared_ptr<Network::HttpRequest> request,
                     boost::shared_ptr<Network::TransferListener> listener);
    ScriptedTransfer(const ScriptedTransfer&) = delete;
    ScriptedTransfer& operator=(const ScriptedTransfer&) = delete;

    void start() override;
    void cancel() noexcept override;

    void startWatchdog() { watchdog.start(); }

    /** Tells the listener that it is over. */
    void end(const Network::TransferEnd& how);

  private:
    bool readTo(std::string& received, std::size_t most);
    std::size_t readBody(char* data, std::size_t size);
    void check();
    void forget();

    const boost::shared_ptr<ScriptedTransport> transport;
    const boost::shared_ptr<Network::HttpRequest> request;
    boost::shared_ptr<Network::TransferListener> listener;
    Network::RequestBody body;
    Network::Watchdog watchdog;
    bool paused = false;
};

}  // namespace Lifecycle
