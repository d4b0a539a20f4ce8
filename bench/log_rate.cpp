// Usage records: how many a second go through the collector over one loopback connection, next to a
// bare libcurl handle that asks for the same addresses; what a record costs while it waits; and
// what a store adds: to the call that logs a record, and to the rate of delivery.
#include <curl/curl.h>
#include <malloc.h>
#include <sched.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <future>
#include <string>
#include <vector>

#include "bench/HttpSink.h"
#include "core/Logger.h"
#include "core/util/Singleton.h"
#include "logcollector/LogCollector.h"
#include "pal/kd.h"

namespace {

constexpr int ROUNDS = 15;
constexpr int RECORDS = 2000;
constexpr int WAITING_RECORDS = 20000;
const char* const UUID = "0123456789abcdef0123456789abcdef";

void logRecords(int count) {
    for (int i = 0; i < count; ++i) {
        LogCollector::logEvent("bench", "screenOpened",
                               {{"screen", "settings"}, {"number", std::to_string(i)}});
    }
}

// A request of this size takes less time than waking a sleeping processor, which a virtual machine
// makes dearer still: spread over two, client and endpoint would measure the scheduler. The threads
// that are started later inherit this.
void stayOnOneProcessor() {
    cpu_set_t allowed;
    CPU_ZERO(&allowed);
    CPU_SET(sched_getcpu(), &allowed);
    if (sched_setaffinity(0, sizeof(allowed), &allowed) != 0) {
        std::perror("log_rate: cannot stay on one processor");
        std::exit(1);
    }
}

double perSecond(std::size_t count, int64_t nanoseconds) {
    return static_cast<double>(count) * 1e9 / static_cast<double>(nanoseconds);
}

struct Round {
    double usPerCall = 0;
    double perSecond = 0;
};

Round measureCollector() {
    std::promise<void> delivered;
    Round round;
    // Until all are logged, a record may find itself the last one.
    {
        const Util::EventLock lock;
        LogCollector::setDeliveredCallback([&delivered] { delivered.set_value(); });
        const int64_t start = kdGetTimeUST();
        logRecords(RECORDS);
        round.usPerCall = static_cast<double>(kdGetTimeUST() - start) / 1000 / RECORDS;
    }
    const int64_t start = kdGetTimeUST();
    delivered.get_future().wait();
    round.perSecond = perSecond(RECORDS, kdGetTimeUST() - start);
    LogCollector::setDeliveredCallback({});
    return round;
}

std::size_t dropBody(char* /*data*/, std::size_t size, std::size_t count, void* /*user*/) {
    return size * count;
}

double measureBareCurl(CURL* handle, const std::string& host,
                       const std::vector<std::string>& targets) {
    const int64_t start = kdGetTimeUST();
    for (const std::string& target : targets) {
        curl_easy_setopt(handle, CURLOPT_URL, (host + target).c_str());
        if (curl_easy_perform(handle) != CURLE_OK) {
            std::fprintf(stderr, "log_rate: the bare request fails\n");
            std::exit(1);
        }
    }
    return perSecond(targets.size(), kdGetTimeUST() - start);
}

double median(std::vector<double> values) {
    std::nth_element(values.begin(), values.begin() + ROUNDS / 2, values.end());
    return values[ROUNDS / 2];
}

void measureRate() {
    Bench::HttpSink sink;
    const std::string host = "http://127.0.0.1:" + std::to_string(sink.getPort());
    LogCollector::configure(UUID, host + "/log");
    CURL* const handle = curl_easy_init();
    curl_easy_setopt(handle, CURLOPT_WRITEFUNCTION, &dropBody);
    curl_easy_setopt(handle, CURLOPT_PROXY, "");
    curl_easy_setopt(handle, CURLOPT_NOSIGNAL, 1L);

    std::vector<double> collected;
    std::vector<double> bare;
    std::vector<double> ratios;
    int connections = 0;
    int bareConnections = 0;
    for (int round = 0; round < ROUNDS; ++round) {
        collected.push_back(measureCollector().perSecond);
        const Bench::HttpSink::Traffic traffic = sink.takeTraffic();
        bare.push_back(measureBareCurl(handle, host, traffic.targets));
        ratios.push_back(collected.back() / bare.back());
        connections += traffic.connections;
        bareConnections += sink.takeTraffic().connections;
    }
    curl_easy_cleanup(handle);
    std::printf("baseline: one libcurl handle       %8.0f requests/s, %d connection(s)\n",
                median(bare), bareConnections);
    std::printf("collector                          %8.0f records/s,  %d connection(s)\n",
                median(collected), connections);
    std::printf("collector / baseline               %8.2f (wanted: at least 0.95)\n",
                median(ratios));
    Util::SingletonStorage::destroyAll();
}

struct Figures {
    std::vector<double> usPerCall;
    std::vector<double> perSecond;
};

/** A collector of its own, with a store in `folder` unless that is empty. */
Round measureAlone(const Bench::HttpSink& sink, const std::string& folder) {
    LogCollector::configure(UUID, "http://127.0.0.1:" + std::to_string(sink.getPort()) + "/log");
    LogCollector::setLoggingEnabled(true);
    LogCollector::startSession("bench");
    LogCollector::LogStoreOptions options;
    options.folder = folder;
    if (!folder.empty() && !LogCollector::openStore(options)) {
        std::fprintf(stderr, "log_rate: no store in %s\n", folder.c_str());
        std::exit(1);
    }
    const Round round = measureCollector();
    Util::SingletonStorage::destroyAll();
    return round;
}

void measureStore() {
    std::string folder = (std::filesystem::temp_directory_path() / "log_rate-XXXXXX").string();
    if (mkdtemp(folder.data()) == nullptr) {
        std::perror("log_rate: no folder for the store");
        std::exit(1);
    }
    const Bench::HttpSink sink;
    Figures memory;
    Figures stored;
    for (int round = 0; round < ROUNDS; ++round) {
        for (Figures* figures : {&memory, &stored}) {
            const Round one = measureAlone(sink, figures == &stored ? folder : std::string());
            figures->usPerCall.push_back(one.usPerCall);
            figures->perSecond.push_back(one.perSecond);
        }
    }
    std::filesystem::remove_all(folder);
    std::printf("baseline: memory only              %8.2f us a call, %8.0f records/s\n",
                median(memory.usPerCall), median(memory.perSecond));
    std::printf("store                              %8.2f us a call, %8.0f records/s\n",
                median(stored.usPerCall), median(stored.perSecond));
}

void measureMemory() {
    LogCollector::configure(UUID, "http://");  // makes every record wait
    LogCollector::setLoggingEnabled(true);
    LogCollector::startSession("bench");
    logRecords(1);
    const std::size_t before = mallinfo2().uordblks;
    logRecords(WAITING_RECORDS);
    const std::size_t after = mallinfo2().uordblks;
    std::printf("memory of a record that waits      %8.0f bytes (of them its text: about 95)\n",
                static_cast<double>(after - before) / WAITING_RECORDS);
}

}  // namespace

int main() {
    stayOnOneProcessor();
    kdSetLogSinkKOR([](const char*, void*) {}, nullptr);
    Logger::setLevel(Logger::SILENT);
    LogCollector::setLoggingEnabled(true);
    LogCollector::startSession("bench");
    measureRate();
    measureStore();
    measureMemory();
    return 0;
}
