#include "LogCommand.h"

#include <condition_variable>
#include <map>
#include <mutex>

#include "Address.h"
#include "CertificateFile.h"
#include "ExitStatus.h"
#include "Interrupts.h"
#include "UsageError.h"
#include "core/Logger.h"
#include "core/util/EventLock.h"
#include "core/util/Time.h"
#include "core/util/Timer.h"
#include "pal/kd_event.h"

namespace Cli {

namespace {

using Util::NS_PER_S;

std::map<std::string, std::string> readParams(const std::vector<std::string>& texts) {
    std::map<std::string, std::string> params;
    for (const std::string& text : texts) {
        const std::size_t equals = text.find('=');
        if (equals == std::string::npos || equals == 0) {
            throw UsageError("parameter " + text + ": expected key=value");
        }
        if (!params.emplace(text.substr(0, equals), text.substr(equals + 1)).second) {
            throw UsageError("parameter " + text.substr(0, equals) + " is given twice");
        }
    }
    return params;
}

/** Something that may come to its end in several ways, at several times. */
class End {
  public:
    void come() {
        const std::lock_guard<std::mutex> lock(mutex);
        isHere = true;
        changed.notify_all();
    }
    void wait() {
        std::unique_lock<std::mutex> lock(mutex);
        changed.wait(lock, [this] { return isHere; });
    }

  private:
    std::mutex mutex;
    std::condition_variable changed;
    bool isHere = false;
};

/** @return whether there is a store */
bool submit(const LogOptions& options, const std::map<std::string, std::string>& params) {
    LogCollector::configure(options.uuid, options.url);
    LogCollector::setLoggingEnabled(true);
    LogCollector::LogStoreOptions store;
    store.folder = options.store;
    // Under one lock: until the event is logged, the last record of the store is not the last one.
    const Util::EventLock lock;
    const bool isStored = !options.store.empty() && LogCollector::openStore(store);
    LogCollector::startSession(options.session);
    const auto log = options.error ? &LogCollector::logError : &LogCollector::logEvent;
    log(options.session, options.name, params);
    return isStored;
}

}  // namespace

int runLog(const LogOptions& options, Console& console, LogOutput& log) {
    const std::map<std::string, std::string> params = readParams(options.params);
    checkUrl(options.url);
    checkQueryValue("uuid", options.uuid);
    if (!options.certificateFile.empty()) {
        trustAuthoritiesOf(options.certificateFile);
    }
    Logger::setLevel(options.verbosity);
    log.show(options.verbosity > 0);
    End end;
    Util::Timer timer([&end] { end.come(); });
    const Interrupts interrupts([&end] { end.come(); });
    LogCollector::setDeliveredCallback([&end] { end.come(); });
    timer.start(KD_TIMER_ONESHOT, options.timeoutS * NS_PER_S);
    const bool isStored = submit(options, params);
    end.wait();
    LogCollector::setDeliveredCallback({});
    log.show(false);  // the verdict is the last line
    const std::size_t left = LogCollector::getPendingCount();
    if (left == 0) {
        return EXIT_OK;
    }
    console.err << "talvox: " << left << (left == 1 ? " record is" : " records are")
                << " not delivered";
    if (isStored) {
        console.err << (left == 1 ? ", it stays in " : ", they stay in ") << options.store;
    }
    console.err << std::endl;
    return EXIT_ENDED_IN_ERROR;
}

}  // namespace Cli
