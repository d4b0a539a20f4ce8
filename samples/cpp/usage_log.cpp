// Logs a usage event and waits until it is delivered. An application would not wait: what is not
// delivered stays in the folder for its next start.
// usage: usage_log FOLDER [ENDPOINT]
#include <logcollector/LogCollector.h>

#include <chrono>
#include <future>
#include <iostream>

int main(int argc, char** argv) {
    if (argc < 2) {
        std::cerr << "usage: usage_log FOLDER [ENDPOINT]" << std::endl;
        return 2;
    }
    // Address and identifier before the store: delivery of what it holds begins at once.
    LogCollector::configure("0123456789abcdef0123456789abcdef",
                            argc > 2 ? argv[2] : "http://127.0.0.1:8090/log");
    LogCollector::LogStoreOptions options;
    options.folder = argv[1];
    if (!LogCollector::openStore(options)) {
        std::cerr << "events are not stored" << std::endl;
    }
    LogCollector::setLoggingEnabled(true);
    LogCollector::startSession("sample");
    LogCollector::logEvent("sample", "opened", {{"screen", "main"}, {"took", "12 ms"}});
    LogCollector::stopSession("sample");

    std::promise<void> delivered;
    LogCollector::setDeliveredCallback([&delivered] { delivered.set_value(); });
    if (LogCollector::getPendingCount() > 0) {
        delivered.get_future().wait_for(std::chrono::seconds(30));
    }
    LogCollector::setDeliveredCallback({});
    std::cout << LogCollector::getPendingCount() << " events are not delivered" << std::endl;
    return LogCollector::getPendingCount() == 0 ? 0 : 1;
}
