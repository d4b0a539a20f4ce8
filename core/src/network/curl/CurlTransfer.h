#pragma once

#include <curl/curl.h>

#include <array>
#include <atomic>
#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <memory>
#include <string>

#include "core/network/TransferTrace.h"
#include "core/network/Transport.h"
#include "network/RequestBody.h"
#include "network/Watchdog.h"
#include "network/curl/Handles.h"
#include "network/curl/ResponseHead.h"

namespace Network {

class CurlTransport;

/**
 * One attempt of a request: a libcurl handle and its callbacks. Lives on the network thread, apart
 * from the operations that say otherwise.
 */
class CurlTransfer : public Transfer, public boost::enable_shared_from_this<CurlTransfer> {
  public:
    CurlTransfer(boost::shared_ptr<CurlTransport> transport, boost::shared_ptr<HttpRequest> request,
                 boost::shared_ptr<TransferListener> listener);
    CurlTransfer(const CurlTransfer&) = delete;
    CurlTransfer& operator=(const CurlTransfer&) = delete;

    void start() override;
    void cancel() noexcept override;

    /** Starts to measure the time. Any thread, under the event lock. */
    void startWatchdog() { watchdog.start(); }

    /**
     * Sets what all requests have in common. The rest is set for each request, because a handle
     * serves one after the other without a reset, which could fail and not say so.
     * @return false if memory is short; the handle must not be used then
     */
    static bool setUpHandle(CURL* easy);

    /** Sets up the handle for this request; null when it cannot be done for want of memory. */
    CURL* open(const std::string& certificateFile);

    /** Makes the transfer end with its next progress. Any thread. */
    void endSoon() { unwanted = true; }

    /** What the listener is to hear of an end with this result, before the handle is freed. */
    TransferEnd judge(CURLcode result) const;

    bool hasExpired() const { return watchdog.hasExpired(); }

    /**
     * True, once, when the transfer was given up before anything was sent because of what waited on
     * the kept connection. It can be started again then, and will make a connection of its own.
     */
    bool takeNewConnection();

    /** Goes on with a body that had nothing more to send. */
    void resume();

    /** Frees the handle, which is in no multi handle any more; tells the listener. */
    void end(const TransferEnd& how);

    /** As `end`, silently. */
    void abandon();

  private:
    struct ListDeleter {
        void operator()(curl_slist* list) const { curl_slist_free_all(list); }
    };

    template <typename Value>
    void set(CURLoption option, Value value);
    void setUpRequest();
    void setUpAddress();
    void setUpBody();
    void setUpHeaders();
    void addHeaderLine(const std::string& line);
    void wake();
    bool handleHeadEnd();
    bool isAnswered() const;
    std::string describe(CURLcode result) const;
    long getStatus() const;
    void noteProgress();
    bool canUseConnection(int ownPort);
    void traceConnection();
    int64_t getStageNs(CURLINFO stage) const;

    std::size_t readBody(char* data, std::size_t size);
    std::size_t takeHeaderLine(const char* data, std::size_t size);
    static int onConnection(void* self, char* peerAddress, char* ownAddress, int peerPort,
                            int ownPort);
    static std::size_t onRead(char* data, std::size_t size, std::size_t count, void* self);
    static int onSeek(void* self, curl_off_t offset, int origin);
    static std::size_t onHeader(char* data, std::size_t size, std::size_t count, void* self);
    static std::size_t onWrite(char* data, std::size_t size, std::size_t count, void* self);
    static int onProgress(void* self, curl_off_t downTotal, curl_off_t downNow, curl_off_t upTotal,
                          curl_off_t upNow);

    const boost::shared_ptr<CurlTransport> transport;
    const boost::shared_ptr<HttpRequest> request;
    boost::shared_ptr<TransferListener> listener;
    /** The listener, if it wants to know the stages. */
    TransferTrace* trace;
    bool connectionTraced = false;
    Watchdog watchdog;
    std::atomic<bool> wakeUpPosted{false};
    std::atomic<bool> unwanted{false};

    std::unique_ptr<curl_slist, ListDeleter> headerLines;
    std::array<char, CURL_ERROR_SIZE> errorText{};
    bool isSetUp = false;
    /** Set when we ended the transfer ourselves; libcurl only knows that a callback failed. */
    const char* refusal = nullptr;
    Handle handle;
    RequestBody body;
    ResponseHead head;
    bool paused = false;
    bool headDelivered = false;
    bool needsNewConnection = false;
    curl_off_t receivedBytes = 0;
    curl_off_t movedBytes = 0;
};

}  // namespace Network
