/**
 * @file
 * Keeps the records of a sender in a store, within its bounds.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <list>
#include <memory>
#include <string>

#include "logcollector/impl/LogStore.h"

namespace LogCollector {

/**
 * Stands between the queue of a sender and its store. Without a store nothing happens here.
 *
 * Where a bound is reached, the oldest segment of the store goes and takes its records out of the
 * queue. One record, the notice, tells how many; while it waits, a later one with the sum replaces
 * it. The record that is on its way is never dropped: it moves to the newest segment first.
 *
 * Not synchronised: the caller holds the event lock and the lock of the queue.
 */
class LogKeeper {
  public:
    static const std::string TAG;

    /** The name of the notice; its parameter "count" says how many records were dropped. */
    static const std::string NOTICE;

    /** The session that the notice names. */
    static const std::string NOTICE_SESSION;

    /** @param sentRecords the record that is on its way, if there is one */
    LogKeeper(std::list<LogRecord>& queuedRecords, std::list<LogRecord>& sentRecords);

    bool hasStore() const { return store != nullptr; }

    /** Puts what the store has in front of the queue, and the queue's own records into the store.
     */
    void use(std::unique_ptr<LogStore> openStore, LogStore::Rest rest);

    /** Stores a record that is in neither list yet; drops what is beyond the bounds. */
    void keep(LogRecord& record);

    /** Takes a delivered record out of the store. */
    void release(const LogRecord& record);

    /** Drops what is beyond the age. */
    void expire();

  private:
    std::size_t countQueued(uint32_t segment) const;
    bool makeRoom(std::size_t textBytes);
    bool dropOldest();
    bool moveSent(uint32_t segment);
    bool replaceByNotice(uint32_t segment);

    std::list<LogRecord>& queue;
    std::list<LogRecord>& sent;
    std::unique_ptr<LogStore> store;
    uint64_t noticeTicket = 0; /**< of the notice in the queue; 0 without one */
    uint64_t noticeLost = 0;
};

}  // namespace LogCollector
