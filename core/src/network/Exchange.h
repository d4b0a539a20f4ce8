#pragma once

#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <string>
#include <vector>

#include "core/network/NetworkTask.h"
#include "core/network/NetworkTaskRetryPolicy.h"
#include "core/network/Transport.h"
#include "core/util/Timer.h"

namespace Network {

/**
 * One submitted task with all its attempts. Everything in here is guarded by the event lock; calls
 * that come from the network thread take it and then see whether anybody still wants to hear.
 */
class Exchange : public boost::enable_shared_from_this<Exchange>, public TransferListener {
  public:
    /** @param endHere the task's end is told on the network thread */
    Exchange(boost::shared_ptr<Transport> transport, boost::shared_ptr<NetworkTask> task,
             boost::shared_ptr<NetworkTaskRetryPolicy> policy, bool endHere);

    /** Begins the first attempt. Under the event lock, as the next two. */
    void start();

    /** Releases the task and ends the transfer; no callback of the task runs any more. */
    void cancel();

    bool isActive() const { return active; }

    bool onTransferHead(const boost::shared_ptr<HttpResponse>& response) override;
    bool onTransferBytes(const unsigned char* bytes, std::size_t size) override;
    void onTransferEnd(const TransferEnd& how) override;

  private:
    /** Makes one of the network thread's calls. @return false when it threw */
    template <typename Call>
    bool callTask(Call call) noexcept;
    void endWithException() noexcept;
    void noteException(const char* what) noexcept;
    void retry();
    void postAttempt();
    void attempt();
    boost::shared_ptr<Transfer> makeTransfer();
    boost::shared_ptr<TransferListener> chooseListener(NetworkTask& current,
                                                       const HttpRequest& request);
    bool prepareTask(const boost::shared_ptr<NetworkTask>& current);
    bool takeBytes(const unsigned char* bytes, std::size_t size);
    void takeEnd(const TransferEnd& how);
    bool collect(const unsigned char* bytes, std::size_t size);
    void retryOrFinish(int code);
    void finish(int code);
    bool postEnd(int code);
    static void onPosted(void* user);
    void deliverEnd(int code);
    bool mayDeliver() const;

    const boost::shared_ptr<Transport> transport;
    boost::shared_ptr<NetworkTask> task;
    boost::shared_ptr<NetworkTaskRetryPolicy> policy;
    const bool endsHere;
    boost::shared_ptr<Transfer> transfer;
    std::vector<unsigned char> collected;
    /** Why the running attempt fails, as far as its response, or our refusal of it, says so. */
    std::string attemptReason;
    Util::Timer retryTimer;
    int attempts = 0;
    bool active = true;
    /** Keeps this alive while its end is on its way to the event thread; posting takes no memory.
     */
    boost::shared_ptr<Exchange> posted;
    int postedCode = 0;
};

}  // namespace Network
