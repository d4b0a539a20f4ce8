#include "logcollector/impl/LogSender.h"

#include <boost/make_shared.hpp>
#include <boost/weak_ptr.hpp>
#include <exception>
#include <memory>
#include <utility>

#include "core/Logger.h"
#include "core/util/EventLock.h"
#include "core/util/Time.h"
#include "logcollector/impl/LogCollectorNetworkTask.h"

namespace LogCollector {

namespace {

using Util::NS_PER_MS;
using Util::NS_PER_S;
constexpr int RETRY_DELAY_MS = 3000;
constexpr int ATTEMPTS = 2;

class QueueLock {
  public:
    explicit QueueLock(KDThreadMutex* which) : mutex(which) { kdThreadMutexLock(mutex); }
    ~QueueLock() { kdThreadMutexUnlock(mutex); }
    QueueLock(const QueueLock&) = delete;
    QueueLock& operator=(const QueueLock&) = delete;

  private:
    KDThreadMutex* const mutex;
};

}  // namespace

const std::string LogSender::TAG("LogSender");
const std::string LogSender::delimiter(";");

std::string timeToString(long long seconds) {
    const KDtime time = seconds;
    KDTm fields{};
    kdGmtime_r(&time, &fields);
    char text[96];
    kdSprintf_s(text, sizeof(text), "%d-%02d-%02d %02d:%02d:%02d", fields.tm_year, fields.tm_mon,
                fields.tm_mday, fields.tm_hour, fields.tm_min, fields.tm_sec);
    return text;
}

// The next record follows where the last one ends: on the network thread.
LogSender::LogSender()
    : NetworkTaskHolder(EndThread::NETWORK),
      queueMutex(kdThreadMutexCreate(nullptr)),
      keeper(queue, sent),
      pause([this] { goOn(); }) {
    kdInstallCallback(&LogSender::onTimerFired, KD_EVENT_TIMER, this);
}

LogSender::~LogSender() {
    const Util::EventLock lock;
    cancel();
    pause.cancel();
    stopTimer();
    kdInstallCallback(nullptr, KD_EVENT_TIMER, this);
    kdThreadMutexFree(queueMutex);
}

void LogSender::sendLogRecord(const boost::shared_ptr<LogEvent>& event,
                              const std::string& sessionId) {
    sendLogRecord(toString(event, sessionId));
}

std::string LogSender::toString(const boost::shared_ptr<LogEvent>& event,
                                const std::string& sessionId) {
    std::string record = "time=" + timeToString(event->getTimestamp());
    record += delimiter + "sessionId=" + sessionId;
    record += delimiter + "type=" + LogEvent::eventTypesDescriptions[event->getType()];
    record += delimiter + "name=" + event->getName();
    for (auto it = event->getParamsIterator(); it != event->getParamsEndIterator(); ++it) {
        record += delimiter + it->first + "=" + it->second;
    }
    return record;
}

void LogSender::sendLogRecord(const std::string& record) {
    const Util::EventLock lock;
    std::list<LogRecord> one(1, {record, 0});
    useStore([this, &one] { keeper.keep(one.front()); });
    append(one);
    sendNextRecord();
}

template <typename Call>
void LogSender::useStore(Call call) {
    const QueueLock lock(queueMutex);
    try {
        call();
    } catch (const std::exception& exception) {
        Logger::log(Logger::PROBLEM, "%s: the store stays as it is: %s", TAG.c_str(),
                    exception.what());
    }
}

void LogSender::append(std::list<LogRecord>& one) {
    const QueueLock lock(queueMutex);
    queue.splice(queue.end(), one);
}

void LogSender::send(std::list<LogRecord>& one) {
    sent.splice(sent.end(), one);
    try {
        submit(boost::make_shared<LogCollectorNetworkTask>(
                   sent.front().text,
                   [this](bool success, const std::string& record, int status) {
                       onRequestComplete(success, record, status);
                   }),
               boost::make_shared<Network::NetworkTaskBasicRetryPolicy>(RETRY_DELAY_MS, ATTEMPTS,
                                                                        false));
    } catch (const std::exception& exception) {
        Logger::log(Logger::PROBLEM, "%s: a record cannot be sent now: %s", TAG.c_str(),
                    exception.what());
        {
            const QueueLock lock(queueMutex);
            queue.splice(queue.begin(), sent);
        }
        // The timer tries again; without a timer, the next record does.
        startTimer();
    }
}

void LogSender::sendNextRecord() {
    const Util::EventLock lock;
    if (isWorking() || hold != Hold::NONE) {
        return;
    }
    useStore([this] { keeper.expire(); });
    std::list<LogRecord> next;
    {
        const QueueLock queueLock(queueMutex);
        if (!queue.empty()) {
            next.splice(next.end(), queue, queue.begin());
        }
    }
    if (next.empty()) {
        stopTimer();
    } else {
        send(next);
    }
}

bool LogSender::openStore(const LogStoreOptions& options) {
    LogStore::Rest rest;
    // The event thread must not wait for the disk. Without the lock two calls may both get here;
    // the folder's own lock lets one pass, and where the folders differ, the later one is closed.
    std::unique_ptr<LogStore> store = hasStore() ? nullptr : LogStore::open(options, rest);
    const Util::EventLock lock;
    if (keeper.hasStore()) {
        Logger::log(Logger::PROBLEM, "%s: there is a store already, %s is not used", TAG.c_str(),
                    options.folder.c_str());
        return false;
    }
    if (store == nullptr) {
        return false;
    }
    {
        const QueueLock queueLock(queueMutex);
        keeper.use(std::move(store), std::move(rest));
    }
    sendNextRecord();
    return true;
}

bool LogSender::hasStore() const {
    const Util::EventLock lock;
    return keeper.hasStore();
}

void LogSender::startTimer() {
    const Util::EventLock lock;
    if (timer == nullptr) {
        timer = kdSetTimer(timerPeriodS * NS_PER_S, KD_TIMER_PERIODIC_AVERAGE, this);
    }
}

void LogSender::stopTimer() {
    const Util::EventLock lock;
    if (timer != nullptr) {
        kdCancelTimer(timer);
        timer = nullptr;
    }
}

bool LogSender::isTimerRunning() const {
    const Util::EventLock lock;
    return timer != nullptr;
}

void LogSender::onTimerFired(const KDEvent* event) {
    static_cast<LogSender*>(event->userptr)->goOn();
}

void LogSender::goOn() {
    hold = Hold::NONE;
    pause.cancel();
    sendNextRecord();
}

void LogSender::onRequestComplete(bool success, const std::string& record, int status) {
    const Util::EventLock lock;
    onFinished();
    if (success) {
        const QueueLock queueLock(queueMutex);
        for (const LogRecord& delivered : sent) {
            keeper.release(delivered);
        }
        sent.clear();
    } else {
        append(sent);
        startTimer();
        holdBack(record, status);
        Logger::log(Logger::PROBLEM, "%s: a dummy record send request fails", TAG.c_str());
    }
    if (isWorking()) {
        onFinished();
    }
    sendNextRecord();
    if (success && onDelivered && getPendingCount() == 0) {
        postDelivered();
    }
}

// The callback may end everything, the network thread included; so it is not for that thread.
void LogSender::postDelivered() {
    using WeakCallback = boost::weak_ptr<const std::function<void()>>;
    auto post = std::make_unique<WeakCallback>(onDelivered);
    kdPostKOR(
        [](void* user) {
            const std::unique_ptr<WeakCallback> posted(static_cast<WeakCallback*>(user));
            if (const auto callback = posted->lock()) {
                (*callback)();
            }
        },
        post.release());
}

// The retry policy spaces the attempts of what it repeats. An endpoint that refuses at once, with a
// status that is final for the policy, gets no more requests than that; and where the address makes
// every request impossible, trying the next record would be as useless.
void LogSender::holdBack(const std::string& record, int status) {
    const int64_t now = kdGetTimeUST();
    if (status == Network::NetworkTask::NO_REQUEST && !LogCollectorNetworkTask::isTooLong(record)) {
        hold = Hold::REFUSED;
    } else if (lastFailureAt && now - *lastFailureAt < RETRY_DELAY_MS * NS_PER_MS) {
        hold = Hold::PAUSED;
        pause.start(KD_TIMER_ONESHOT, RETRY_DELAY_MS * NS_PER_MS);
    }
    lastFailureAt = now;
}

void LogSender::onConfigured() {
    const Util::EventLock lock;
    if (hold == Hold::REFUSED) {
        goOn();
    }
}

std::size_t LogSender::getPendingCount() const {
    const Util::EventLock lock;
    const QueueLock queueLock(queueMutex);
    return queue.size() + (isWorking() ? 1 : 0);
}

void LogSender::setDeliveredCallback(std::function<void()> callback) {
    const Util::EventLock lock;
    // One that has been posted and is replaced now must not run any more.
    onDelivered.reset();
    if (callback) {
        onDelivered = boost::make_shared<const std::function<void()>>(std::move(callback));
    }
}

}  // namespace LogCollector
