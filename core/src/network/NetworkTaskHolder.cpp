#include "core/network/NetworkTaskHolder.h"

#include <boost/make_shared.hpp>
#include <utility>

#include "core/network/NetworkManager.h"
#include "core/util/EventLock.h"
#include "network/Exchange.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"

namespace Network {

NetworkTaskHolder::NetworkTaskHolder(EndThread endThread) : thread(endThread) {}

NetworkTaskHolder::~NetworkTaskHolder() {
    cancel();
}

void NetworkTaskHolder::submit(const boost::shared_ptr<NetworkTask>& task,
                               const boost::shared_ptr<NetworkTaskRetryPolicy>& policy) {
    const Util::EventLock lock;
    if (!KOR_ASSERT(task)) {
        return;
    }
    if (isWorking()) {
        kdLogMessage("NetworkTaskHolder: a running task gives way to the next one");
    }
    const auto next = boost::make_shared<Exchange>(NetworkManager::getInstance().getTransport(),
                                                   task, policy, thread == EndThread::NETWORK);
    // Nothing of it is delivered before the event lock is free. A start that throws changes
    // nothing.
    next->start();
    const boost::shared_ptr<Exchange> previous = std::exchange(exchange, next);
    if (previous) {
        previous->cancel();
    }
}

void NetworkTaskHolder::submitNoRetries(const boost::shared_ptr<NetworkTask>& task) {
    submit(task, nullptr);
}

void NetworkTaskHolder::cancel() {
    const Util::EventLock lock;
    // Forgotten first: the end of the task may come back to this holder.
    if (const boost::shared_ptr<Exchange> ended = std::move(exchange)) {
        ended->cancel();
    }
}

bool NetworkTaskHolder::isWorking() const {
    const Util::EventLock lock;
    return exchange && exchange->isActive();
}

void NetworkTaskHolder::onFinished() {
    cancel();
}

}  // namespace Network
