#pragma once

#include <curl/curl.h>

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "ProbeTarget.h"

namespace Cli {

/** One request of the doctor. */
struct ProbeRequest {
    std::string path;                /**< path and query, behind the target's address */
    std::vector<std::string> pieces; /**< of the body */
    int paceMs = -1; /**< between the pieces of a streamed body; below 0: in one piece, whole */
};

/** What became of a connection or request. */
struct ProbeResult {
    CURLcode code = CURLE_OK;
    std::string error;     /**< libcurl's words for `code` */
    int systemError = 0;   /**< the system's number for a connection that failed */
    long verifyResult = 0; /**< OpenSSL's number for a certificate that was refused */
    bool isTimeout = false;

    std::string ip;
    long port = 0;
    double nameMs = 0;
    double connectMs = 0;
    double tlsMs = 0;

    int status = 0;                             /**< 0 without an answer */
    std::map<std::string, std::string> headers; /**< by lower-case name */
    std::string body;                           /**< its first 4 KiB */
    double streamedMs = 0;                      /**< from the first piece to the last */
    double answerMs = 0;      /**< from the last piece to the head of the answer */
    bool isCutShort = false;  /**< the answer came before the last piece was sent */
    bool isConnected = false; /**< a connection was made */
};

/**
 * A connection to a gateway for one check, watched more closely than the network layer of the
 * library does. It follows the same rules: HTTP/1.1, TLS 1.2 or later, no proxy, no redirect.
 * Blocks; one thread.
 */
class HttpProbe {
  public:
    explicit HttpProbe(const ProbeTarget& probeTarget);
    ~HttpProbe();
    HttpProbe(const HttpProbe&) = delete;
    HttpProbe& operator=(const HttpProbe&) = delete;

    /**
     * Opens a connection, with TLS for an https address, and sends nothing on it.
     * @param verifies false to accept any certificate, in order to read it
     */
    ProbeResult connect(bool verifies);

    /** Fields of the server's certificate, by OpenSSL's names, after `connect`. */
    std::map<std::string, std::string> readCertificate() const;

    /** Sends a request and reads its answer. */
    ProbeResult send(const ProbeRequest& request);

    /**
     * Waits until the server closes the connection of the last answer.
     * @return after how many milliseconds; nothing if it is open after `maxMs`
     */
    std::optional<double> waitForClose(int maxMs) const;

  private:
    struct Callbacks;

    template <typename Value>
    void set(CURLoption option, Value value);
    void setUp(const std::string& url);
    ProbeResult run();
    void finish(ProbeResult& result) const;
    bool isStalled() const;
    int resume();
    std::size_t give(char* buffer, std::size_t room);
    void takeHeader(const std::string& line);

    const ProbeTarget target;
    std::unique_ptr<CURL, decltype(&curl_easy_cleanup)> easy;
    std::unique_ptr<CURLM, decltype(&curl_multi_cleanup)> multi;
    std::unique_ptr<curl_slist, decltype(&curl_slist_free_all)> headerLines;
    char errorText[CURL_ERROR_SIZE] = {};

    const ProbeRequest* sending = nullptr;
    std::size_t piece = 0;  /**< index of the next piece */
    std::size_t offset = 0; /**< of the next byte in it */
    bool isPaused = false;
    int64_t firstPieceAt = 0;
    int64_t lastPieceAt = 0;
    int64_t answeredAt = 0;
    int64_t progressAt = 0;
    ProbeResult answer;
};

}  // namespace Cli
