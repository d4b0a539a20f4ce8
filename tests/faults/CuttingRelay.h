/**
 * @file
 * A way to a server that breaks once.
 */
#pragma once

#include <condition_variable>
#include <cstddef>
#include <mutex>
#include <string>
#include <thread>

namespace FaultTest {

/**
 * Passes bytes between its own loopback port and another, one connection after the other. The first
 * connection is reset once so many bytes have gone to the server.
 */
class CuttingRelay {
  public:
    CuttingRelay(unsigned short serverPort, std::size_t bytesOfTheFirst);
    ~CuttingRelay();
    CuttingRelay(const CuttingRelay&) = delete;
    CuttingRelay& operator=(const CuttingRelay&) = delete;

    std::string getUrl() const;

    /** Waits until `count` connections have come; false when they do not. */
    bool waitForConnections(std::size_t count, int milliseconds) const;
    /** Waits until the first connection has been cut. */
    bool waitForCut() const;

  private:
    void run();
    void serve(int client, bool cuts);
    /** @return false when there is nothing more to pass on */
    bool pass(int from, int to, std::size_t& passed) const;

    const unsigned short target;
    const std::size_t limit;
    unsigned short port = 0;
    int listener = -1;
    int stopSignal[2] = {-1, -1};
    mutable std::mutex mutex;
    mutable std::condition_variable changed;
    std::size_t connections = 0;
    bool cut = false;
    std::thread thread;
};

}  // namespace FaultTest
