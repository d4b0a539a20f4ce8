// Logs into a store in bursts, and says after each record that the call has returned, until it is
// killed. usage: log_store_app URL FOLDER MAX_BYTES FIRST_NUMBER BURST; a burst of 0 delivers what
// is left and ends.
#include <unistd.h>

#include <condition_variable>
#include <cstdlib>
#include <mutex>
#include <string>

#include "KilledRecord.h"
#include "core/Logger.h"
#include "core/util/EventLock.h"
#include "logcollector/LogCollector.h"

namespace {

/** Waits for the collector to have nothing left. */
class Drain {
  public:
    Drain() {
        LogCollector::setDeliveredCallback([this] {
            const std::lock_guard<std::mutex> lock(mutex);
            isDelivered = true;
            changed.notify_all();
        });
    }
    ~Drain() { LogCollector::setDeliveredCallback({}); }
    Drain(const Drain&) = delete;
    Drain& operator=(const Drain&) = delete;

    // Not under one lock with the count, which takes the event lock that the callback runs under.
    void wait() {
        while (LogCollector::getPendingCount() > 0) {
            std::unique_lock<std::mutex> lock(mutex);
            changed.wait(lock, [this] { return isDelivered; });
            isDelivered = false;
        }
    }

  private:
    std::mutex mutex;
    std::condition_variable changed;
    bool isDelivered = false;
};

void logOne(int number) {
    LogCollector::logEvent(KILLED_SESSION, "killed", paramsOfKilled(number));
    const std::string line = std::to_string(number) + "\n";
    if (write(STDOUT_FILENO, line.data(), line.size()) < 0) {
        std::_Exit(1);
    }
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 6) {
        return 2;
    }
    LogCollector::LogStoreOptions store;
    store.folder = argv[2];
    store.maxBytes = std::atol(argv[3]);
    int number = std::atoi(argv[4]);
    const int burst = std::atoi(argv[5]);
    Drain drain;
    LogCollector::configure("uuid", argv[1]);
    LogCollector::setLoggingEnabled(true);
    LogCollector::startSession(KILLED_SESSION);
    if (!LogCollector::openStore(store)) {
        return 1;
    }
    for (;;) {
        for (int i = 0; i < burst; ++i) {
            logOne(number++);
        }
        drain.wait();
        if (burst == 0) {
            return 0;
        }
    }
}
