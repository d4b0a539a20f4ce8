// A loopback server that notes when which byte of a streamed body has arrived.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace Bench {

/** Serves one request: reads a chunked body to its end and answers with an empty 200. */
class LatencySink {
  public:
    LatencySink();
    ~LatencySink();
    LatencySink(const LatencySink&) = delete;
    LatencySink& operator=(const LatencySink&) = delete;

    int getPort() const { return port; }

    /** Waits until the request has been read to its end. */
    void join();

    /** After `join`: the time at which body byte `offset` had arrived, in nanoseconds; -1 if not.
     */
    int64_t arrivalOf(std::size_t offset) const;

    /** After `join`: the body without its transfer coding. */
    const std::string& getBody() const { return body; }

  private:
    void serve();
    void decode(const char* data, std::size_t size);

    int port = 0;
    int listener = -1;
    std::thread thread;
    std::string line;
    std::size_t chunkLeft = 0;
    enum class State { HEAD, SIZE, DATA, DATA_END, DONE } state = State::HEAD;
    std::string body;
    std::vector<std::pair<std::size_t, int64_t>> arrivals;
};

/** Connected loopback socket pair over TCP, for the bare baseline. */
std::pair<int, int> tcpPair();

}  // namespace Bench
