#pragma once

#include <curl/curl.h>

#include <atomic>
#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <condition_variable>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "core/network/Transport.h"
#include "network/curl/Handles.h"

namespace Network {

class CurlTransfer;

/** The network thread: runs commands, and transfers by libcurl. */
class CurlTransport : public Transport, public boost::enable_shared_from_this<CurlTransport> {
  public:
    CurlTransport();
    ~CurlTransport() override;
    CurlTransport(const CurlTransport&) = delete;
    CurlTransport& operator=(const CurlTransport&) = delete;

    bool post(std::function<void()> command) override;

    boost::shared_ptr<Transfer> makeTransfer(
        const boost::shared_ptr<HttpRequest>& request,
        const boost::shared_ptr<TransferListener>& listener) override;

    /** Waits two seconds at most: a thread that hangs is left behind. */
    void stop() override;

    bool isStopping() const override { return stopping; }

    void setCertificateFile(const std::string& path) override;

    /** Has the network thread look whether the peer keeps this transfer waiting. Any thread. */
    void requestCheck(const boost::shared_ptr<CurlTransfer>& transfer);

    /** Has a paused transfer look for more to send. Any thread. */
    void requestResume(const boost::shared_ptr<CurlTransfer>& transfer);

    /** Network thread only. */
    void start(const boost::shared_ptr<CurlTransfer>& transfer);

    /** Network thread only. */
    Handles& getHandles() { return handles; }

    /** Has `abandon` called on the network thread. Any thread; does not block, and cannot fail. */
    void requestAbandon(const boost::shared_ptr<CurlTransfer>& transfer) noexcept;

    /** Network thread only; a transfer that is over or was never started is accepted. */
    void abandon(const boost::shared_ptr<CurlTransfer>& transfer);

  private:
    struct MultiDeleter {
        void operator()(CURLM* handle) const { curl_multi_cleanup(handle); }
    };
    using Transfers = std::map<CURL*, boost::shared_ptr<CurlTransfer>>;

    bool launchThread();
    bool takesCommands();
    void wake();
    void wakeFromOutside();
    bool waitForEnd();
    void run();
    bool isWanted();
    bool runCommands();
    void perform();
    void check(const boost::shared_ptr<CurlTransfer>& transfer);
    void finish(Transfers::iterator entry, CURLcode result);
    void finishAll();
    Transfers::iterator find(const boost::shared_ptr<CurlTransfer>& transfer);

    std::mutex mutex;
    std::condition_variable changed;
    // Guarded by the mutex.
    std::vector<std::function<void()>> commands;
    std::vector<boost::shared_ptr<CurlTransfer>> resumed;
    bool awake = false;  // a wake-up is on its way to the thread
    bool closed = false;
    bool finished = false;
    std::string certificateFile;
    std::thread thread;

    std::atomic<bool> stopping{false};

    // Network thread. The connections, which are the multi handle's, go before what they use.
    Handles handles;
    std::unique_ptr<CURLM, MultiDeleter> multi;
    Transfers transfers;
    // Kept for their room: sound that comes piece by piece needs none of its own.
    std::vector<std::function<void()>> currentCommands;
    std::vector<boost::shared_ptr<CurlTransfer>> currentResumed;
};

}  // namespace Network
