#include "logcollector/impl/LogCollectorNetworkTask.h"

#include <utility>

#include "core/Logger.h"
#include "core/util/UrlCoder.h"
#include "logcollector/LogCollector.h"

namespace LogCollector {

namespace {

constexpr int STATUS_OK = 200;

}  // namespace

const std::string LogCollectorNetworkTask::TAG("LogCollectorNetworkTask");

LogCollectorNetworkTask::LogCollectorNetworkTask(std::string recordText, Callback completion)
    : record(std::move(recordText)), callback(std::move(completion)) {}

bool LogCollectorNetworkTask::isTooLong(const std::string& record) {
    constexpr std::size_t MOST_BYTES_OF_ONE = 3;
    const bool isShort = record.size() <= MAX_ENCODED_BYTES / MOST_BYTES_OF_ONE;
    return !isShort && (record.size() > MAX_ENCODED_BYTES ||
                        Util::UrlCoder::urlEncodeString(record).size() > MAX_ENCODED_BYTES);
}

bool LogCollectorNetworkTask::isReadyToPerform() const {
    return true;
}

boost::shared_ptr<Network::HttpRequest> LogCollectorNetworkTask::issueRequest() const {
    const LogCollector& collector = LogCollector::getInstance();
    const std::string prefix = collector.getUrl() + "?uuid=" + collector.getUuid();
    // What follows a "#" is never sent: the endpoint would confirm a record that it did not get.
    if (prefix.find('#') != std::string::npos) {
        Logger::log(Logger::PROBLEM, "%s: no record can follow %s", TAG.c_str(), prefix.c_str());
        return nullptr;
    }
    if (isTooLong(record)) {
        Logger::log(Logger::PROBLEM, "%s: a record of %zu bytes is too long", TAG.c_str(),
                    record.size());
        return nullptr;
    }
    const std::string address = prefix + "&logmessage=" + Util::UrlCoder::urlEncodeString(record);
    Logger::log(Logger::PROGRESS, "%s: request url is %s", TAG.c_str(), address.c_str());
    return Network::HttpRequest::create(address, "GET", TIMEOUT_MS, false);
}

void LogCollectorNetworkTask::onResponseRecieved(boost::shared_ptr<Network::HttpResponse>) {}

void LogCollectorNetworkTask::onBytesReceived(const std::vector<unsigned char>&) {}

void LogCollectorNetworkTask::onFinished(int status) {
    callback(status == STATUS_OK, record, status);
}

}  // namespace LogCollector
