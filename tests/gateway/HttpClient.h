/**
 * @file
 * A client that sends exactly the bytes that a test wants.
 */
#pragma once

#include <cstdint>
#include <map>
#include <string>

namespace GatewayTest {

struct HttpAnswer {
    /** 0 when the server hung up without an answer. */
    int status = 0;
    /** By lower-case name. */
    std::map<std::string, std::string> headers;
    std::string body;
};

/** One connection to a server on 127.0.0.1; gives up waiting after 30 s. */
class HttpClient {
  public:
    /** Throws when nobody listens. */
    explicit HttpClient(uint16_t port);
    ~HttpClient();
    HttpClient(const HttpClient&) = delete;
    HttpClient& operator=(const HttpClient&) = delete;

    /** Sends bytes as they are. @return false when the server has hung up */
    bool send(const std::string& bytes);

    /** Sends bytes as one chunk of a chunked body; none end the body. */
    bool sendChunk(const std::string& bytes);

    /** Reads one answer. */
    HttpAnswer read();

    /** Breaks the connection off with a reset instead of an orderly end. */
    void reset();

  private:
    bool fill();

    int socket = -1;
    std::string buffer;
};

/** The head of a recognition request; `length` below 0 announces a chunked body. */
std::string requestHead(const std::string& target, long length = -1,
                        const std::string& method = "POST");

}  // namespace GatewayTest
