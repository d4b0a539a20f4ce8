#include "logcollector/impl/LogKeeper.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <cinttypes>
#include <utility>

#include "core/Logger.h"
#include "logcollector/LogEvent.h"
#include "logcollector/impl/LogCollectorNetworkTask.h"
#include "logcollector/impl/LogSender.h"

namespace LogCollector {

const std::string LogKeeper::TAG("LogKeeper");
const std::string LogKeeper::NOTICE("logRecordsDropped");
const std::string LogKeeper::NOTICE_SESSION("logStore");

LogKeeper::LogKeeper(std::list<LogRecord>& queuedRecords, std::list<LogRecord>& sentRecords)
    : queue(queuedRecords), sent(sentRecords) {}

void LogKeeper::use(std::unique_ptr<LogStore> openStore, LogStore::Rest rest) {
    store = std::move(openStore);
    noticeTicket = rest.noticeTicket;
    noticeLost = rest.noticeLost;
    queue.splice(queue.begin(), rest.records);
    expire();
    makeRoom(0);
    for (LogRecord& record : sent) {
        keep(record);
    }
    // What is dropped meanwhile has a ticket; the record in hand has none yet.
    for (LogRecord& record : queue) {
        if (record.ticket == 0) {
            keep(record);
        }
    }
}

void LogKeeper::keep(LogRecord& record) {
    if (store == nullptr) {
        return;
    }
    const std::size_t size = record.text.size();
    if (LogCollectorNetworkTask::isTooLong(record.text) || store->isTooLarge(size)) {
        Logger::log(Logger::PROBLEM, "%s: a record of %zu bytes is too long for the store",
                    TAG.c_str(), size);
        return;
    }
    expire();
    if (makeRoom(size)) {
        record.ticket = store->add(record.text);
    }
}

void LogKeeper::release(const LogRecord& record) {
    if (store != nullptr && record.ticket != 0) {
        store->remove(record.ticket);
        if (record.ticket == noticeTicket) {
            noticeTicket = 0;
        }
    }
}

void LogKeeper::expire() {
    while (store != nullptr && store->isExpired() && countQueued(store->getOldest()) > 0 &&
           dropOldest()) {
    }
}

bool LogKeeper::makeRoom(std::size_t textBytes) {
    // The record on its way and the notice move from the oldest segment to the newest: once round
    // is enough.
    for (std::size_t left = store->getSegmentCount() + 1; store->isFull(textBytes); --left) {
        if (left == 0) {
            Logger::log(Logger::PROBLEM, "%s: the store has no room for a record of %zu bytes",
                        TAG.c_str(), textBytes);
        }
        if (left == 0 || !dropOldest()) {
            return false;
        }
    }
    return true;
}

std::size_t LogKeeper::countQueued(uint32_t segment) const {
    return static_cast<std::size_t>(
        std::count_if(queue.begin(), queue.end(), [this, segment](const LogRecord& record) {
            return LogStore::segmentOf(record.ticket) == segment && record.ticket != noticeTicket;
        }));
}

/** @return false when nothing could be dropped */
bool LogKeeper::dropOldest() {
    const uint32_t segment = store->getOldest();
    const bool isAlone = store->getSegmentCount() <= 1;
    if (segment == 0 || (isAlone && !store->startSegment()) || !moveSent(segment)) {
        return false;
    }
    // Without the record on its way it may be gone already.
    return !store->has(segment) || replaceByNotice(segment);
}

bool LogKeeper::moveSent(uint32_t segment) {
    if (sent.empty() || LogStore::segmentOf(sent.front().ticket) != segment) {
        return true;
    }
    const uint64_t ticket = store->addNotice(sent.front().text, {0, 0, sent.front().ticket});
    if (ticket == 0) {
        return false;
    }
    const uint64_t before = std::exchange(sent.front().ticket, ticket);
    if (before == noticeTicket) {
        noticeTicket = 0;
    }
    store->remove(before);
    return true;
}

bool LogKeeper::replaceByNotice(uint32_t segment) {
    // One that is on its way may arrive: what follows has a notice of its own.
    const bool isQueued =
        noticeTicket != 0 && (sent.empty() || sent.front().ticket != noticeTicket);
    const uint64_t replaced = isQueued ? noticeTicket : 0;
    const uint64_t count = countQueued(segment);
    const uint64_t lost = count + (isQueued ? noticeLost : 0);
    const auto event = boost::make_shared<LogEvent>(
        LogEvent::error, NOTICE, LogEvent::Params{{"count", std::to_string(lost)}});
    std::list<LogRecord> notice(1, {LogSender::toString(event, NOTICE_SESSION), 0});
    notice.front().ticket = store->addNotice(notice.front().text, {lost, segment, replaced});
    if (notice.front().ticket == 0) {
        return false;
    }
    queue.remove_if([segment, replaced](const LogRecord& record) {
        return record.ticket != 0 &&
               (LogStore::segmentOf(record.ticket) == segment || record.ticket == replaced);
    });
    store->remove(replaced);
    store->drop(segment);
    noticeTicket = notice.front().ticket;
    noticeLost = lost;
    queue.splice(queue.end(), notice);
    if (count > 0) {
        Logger::log(Logger::PROBLEM,
                    "%s: the store is at its bound, the oldest %" PRIu64 " records are dropped",
                    TAG.c_str(), count);
    }
    return true;
}

}  // namespace LogCollector
