#include "logcollector/LogCollector.h"

#include <boost/make_shared.hpp>
#include <exception>
#include <utility>

#include "core/Logger.h"
#include "core/network/NetworkManager.h"
#include "core/util/EventLock.h"
#include "logcollector/impl/LogSender.h"

namespace LogCollector {

namespace {

const char* const END_OF_SESSION = "logSessionStopped";

/** Makes a call for the application, which gets no exception: its usage log is not worth its end.
 */
template <typename Call>
void record(const char* operation, Call call) {
    const Util::EventLock lock;
    try {
        call();
    } catch (const std::exception& exception) {
        Logger::log(Logger::PROBLEM, "%s::%s: nothing is recorded: %s", LogCollector::TAG.c_str(),
                    operation, exception.what());
    }
}

/** The same with the collector, which the first call makes. */
template <typename Call>
void use(const char* operation, Call call) {
    record(operation, [&call] { call(LogCollector::getInstance()); });
}

/** Makes the network's singleton the older one, so that it outlives the sender. */
boost::shared_ptr<LogSender> makeSender() {
    Network::NetworkManager::getInstance();
    return boost::make_shared<LogSender>();
}

}  // namespace

const std::string LogCollector::TAG("LogCollector");
const std::string LogCollector::URL_DFLT("http://127.0.0.1:8090/log");

LogCollector& LogCollector::getInstance() {
    return instance();
}

LogCollector::LogCollector() : sender(makeSender()), url(URL_DFLT) {}

LogCollector::~LogCollector() = default;

void LogCollector::setLoggingEnabled(bool value) {
    const Util::EventLock lock;
    enabled = value;
}

bool LogCollector::isLoggingEnabled() const {
    const Util::EventLock lock;
    return enabled;
}

void LogCollector::configure(const std::string& clientUuid) {
    const Util::EventLock lock;
    uuid = clientUuid;
    sender->onConfigured();
}

void LogCollector::configure(const std::string& clientUuid, const std::string& endpointUrl) {
    const Util::EventLock lock;
    std::string nextUuid = clientUuid;
    url = endpointUrl;
    uuid.swap(nextUuid);
    sender->onConfigured();
}

std::string LogCollector::getUrl() const {
    const Util::EventLock lock;
    return url;
}

std::string LogCollector::getUuid() const {
    const Util::EventLock lock;
    return uuid;
}

bool LogCollector::openStore(const LogStoreOptions& options) {
    return sender->openStore(options);
}

void LogCollector::startSession(const std::string& id) {
    record("startSession", [this, &id] {
        if (!isOff("startSession") && !sessions.insert(id).second) {
            Logger::log(Logger::PROBLEM, "%s: session %s already exists.", TAG.c_str(), id.c_str());
        }
    });
}

void LogCollector::stopSession(const std::string& id) {
    record("stopSession", [this, &id] {
        if (!isOff("stopSession") && isOpen(id)) {
            sender->sendLogRecord(boost::make_shared<LogEvent>(LogEvent::event, END_OF_SESSION),
                                  id);
            sessions.erase(id);
        }
    });
}

void LogCollector::logEvent(const std::string& sessionId, const std::string& name,
                            const std::map<std::string, std::string>& params) {
    record("logEvent", [&] {
        if (!isOff("logEvent")) {
            log(LogEvent::event, sessionId, name, params);
        }
    });
}

void LogCollector::logError(const std::string& sessionId, const std::string& name,
                            const std::map<std::string, std::string>& params) {
    record("logError", [&] {
        if (!isOff("logError")) {
            log(LogEvent::error, sessionId, name, params);
        }
    });
}

void LogCollector::log(LogEvent::EventType type, const std::string& sessionId,
                       const std::string& name, const std::map<std::string, std::string>& params) {
    if (isOpen(sessionId)) {
        sender->sendLogRecord(boost::make_shared<LogEvent>(type, name, params), sessionId);
    }
}

bool LogCollector::isOff(const char* operation) const {
    if (!enabled) {
        Logger::log(Logger::PROGRESS, "%s::%s: the logging is disabled.", TAG.c_str(), operation);
    }
    return !enabled;
}

bool LogCollector::isOpen(const std::string& sessionId) const {
    const bool open = sessions.count(sessionId) > 0;
    if (!open) {
        Logger::log(Logger::PROBLEM, "%s: session %s is not exists.", TAG.c_str(),
                    sessionId.c_str());
    }
    return open;
}

std::size_t LogCollector::getPendingCount() const {
    return sender->getPendingCount();
}

void LogCollector::setDeliveredCallback(std::function<void()> callback) {
    sender->setDeliveredCallback(std::move(callback));
}

void setLoggingEnabled(bool value) {
    use("setLoggingEnabled", [&](LogCollector& collector) { collector.setLoggingEnabled(value); });
}

bool isLoggingEnabled() {
    return LogCollector::getInstance().isLoggingEnabled();
}

void configure(const std::string& uuid) {
    use("configure", [&](LogCollector& collector) { collector.configure(uuid); });
}

void configure(const std::string& uuid, const std::string& url) {
    use("configure", [&](LogCollector& collector) { collector.configure(uuid, url); });
}

std::string getUrl() {
    return LogCollector::getInstance().getUrl();
}

std::string getUuid() {
    return LogCollector::getInstance().getUuid();
}

bool openStore(const LogStoreOptions& options) {
    return LogCollector::getInstance().openStore(options);
}

void startSession(const std::string& id) {
    use("startSession", [&](LogCollector& collector) { collector.startSession(id); });
}

void stopSession(const std::string& id) {
    use("stopSession", [&](LogCollector& collector) { collector.stopSession(id); });
}

void logEvent(const std::string& sessionId, const std::string& name,
              const std::map<std::string, std::string>& params) {
    use("logEvent", [&](LogCollector& collector) { collector.logEvent(sessionId, name, params); });
}

void logError(const std::string& sessionId, const std::string& name,
              const std::map<std::string, std::string>& params) {
    use("logError", [&](LogCollector& collector) { collector.logError(sessionId, name, params); });
}

std::size_t getPendingCount() {
    return LogCollector::getInstance().getPendingCount();
}

void setDeliveredCallback(std::function<void()> callback) {
    LogCollector::getInstance().setDeliveredCallback(std::move(callback));
}

}  // namespace LogCollector
