// A loopback endpoint that answers every request without a body with an empty 200, as fast as it
// can, and keeps what was asked for.
#pragma once

#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace Bench {

/** A thread for each connection; ends them all when it goes. */
class HttpSink {
  public:
    HttpSink();
    ~HttpSink();
    HttpSink(const HttpSink&) = delete;
    HttpSink& operator=(const HttpSink&) = delete;

    int getPort() const { return port; }

    /** What has been asked for since the last call, and on how many connections. */
    struct Traffic {
        std::vector<std::string> targets;
        int connections = 0;
    };
    Traffic takeTraffic();

  private:
    void serve();
    void serveConnection(int connection);

    int listener = -1;
    int port = 0;
    std::mutex mutex;
    Traffic traffic;
    std::vector<int> connections;
    std::vector<std::thread> servers;
    std::thread thread;
};

}  // namespace Bench
