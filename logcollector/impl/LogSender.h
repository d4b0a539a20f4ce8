/**
 * @file
 * Delivers the records of the log collector, one request at a time.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <list>
#include <optional>
#include <string>

#include "core/network/NetworkTaskHolder.h"
#include "core/util/Timer.h"
#include "logcollector/LogEvent.h"
#include "logcollector/LogStoreOptions.h"
#include "logcollector/impl/LogKeeper.h"
#include "pal/kd.h"

namespace LogCollector {

/**
 * Time as records carry it: the fields of `kdGmtime_r` for `seconds` as they are, so with years
 * counted from 1900 and months from 0. Records pass nanoseconds; the endpoint expects it so.
 */
std::string timeToString(long long seconds);

/**
 * Makes records of events and sends them. A record whose request fails goes to the back of the
 * queue, the front of which is tried at once; a timer takes over when nothing moves any more. All
 * operations take the event lock.
 */
class LogSender : public Network::NetworkTaskHolder {
  public:
    static const std::string TAG;
    static const std::string delimiter;

    static constexpr int64_t TIMER_PERIOD_S_DFLT = 20;

    LogSender();
    ~LogSender() override;

    void sendLogRecord(const boost::shared_ptr<LogEvent>& event, const std::string& sessionId);

    /** Sends now, or queues while another record is on its way. */
    void sendLogRecord(const std::string& record);

    /** The record of an event; nothing in it is escaped. */
    static std::string toString(const boost::shared_ptr<LogEvent>& event,
                                const std::string& sessionId);

    /** Sends the front of the queue unless a request runs; without a queue, ends the timer. */
    void sendNextRecord();

    void startTimer();
    void stopTimer();
    bool isTimerRunning() const;
    static void onTimerFired(const KDEvent* event);

    /** The end of a request; `status` as for `Network::NetworkTask::onFinished`. */
    void onRequestComplete(bool success, const std::string& record, int status);

    /** There is a new address: what was refused because of the old one need not wait any more. */
    void onConfigured();

    /**
     * Stores records from now on, those that wait included; what the store has goes first. Reads
     * files before it takes the event lock.
     * @return false when there is a store already or the folder cannot be used; the log says why
     */
    bool openStore(const LogStoreOptions& options);

    /** Records in the queue and on their way. */
    std::size_t getPendingCount() const;

    void setDeliveredCallback(std::function<void()> callback);

  private:
    /** Why nothing is sent although no request runs. */
    enum class Hold {
        NONE,
        PAUSED, /**< requests fail faster than the retry policy would repeat them */
        REFUSED /**< there could be no request; the timer, or a new address, goes on */
    };

    /** Puts the one record of the list at the end of the queue; nothing is allocated. */
    void append(std::list<LogRecord>& one);
    void send(std::list<LogRecord>& one);
    /** For want of memory, the records are those in memory only. */
    template <typename Call>
    void useStore(Call call);
    bool hasStore() const;
    void holdBack(const std::string& record, int status);
    void goOn();
    void postDelivered();

    std::list<LogRecord> queue;
    KDTimer* timer = nullptr;
    int64_t timerPeriodS = TIMER_PERIOD_S_DFLT;
    KDThreadMutex* const queueMutex;

    std::list<LogRecord> sent; /**< the record of the request that runs */
    LogKeeper keeper;
    Hold hold = Hold::NONE;
    Util::Timer pause;
    std::optional<int64_t> lastFailureAt;
    boost::shared_ptr<const std::function<void()>> onDelivered;
};

}  // namespace LogCollector
