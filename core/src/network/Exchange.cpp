#include "network/Exchange.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <utility>

#include "core/util/EventLock.h"
#include "network/EventThread.h"
#include "network/FailureText.h"
#include "network/RequestCheck.h"
#include "network/Transport.h"
#include "pal/kd_event.h"
#include "pal/kd_log.h"

namespace Network {

namespace {

constexpr std::size_t MOST_COLLECTED_BYTES = std::size_t{1024} * 1024;
constexpr int64_t NS_PER_MS = 1000000;

}  // namespace

Exchange::Exchange(boost::shared_ptr<Transport> owner, boost::shared_ptr<NetworkTask> what,
                   boost::shared_ptr<NetworkTaskRetryPolicy> when, bool endHere)
    : transport(std::move(owner)),
      task(std::move(what)),
      policy(std::move(when)),
      endsHere(endHere),
      retryTimer([this] { postAttempt(); }) {}

void Exchange::start() {
    postAttempt();
}

void Exchange::cancel() {
    if (!active) {
        return;
    }
    active = false;
    retryTimer.cancel();
    if (const boost::shared_ptr<Transfer> ended = std::move(transfer)) {
        const boost::shared_ptr<Transport> runner = transport;
        runner->post([runner, ended] { runner->abandon(ended); });
    }
    policy.reset();
    // Last: the task's destructor may do anything.
    task.reset();
}

void Exchange::postAttempt() {
    const boost::shared_ptr<Exchange> self = shared_from_this();
    if (!transport->post([self] { self->attempt(); })) {
        task->failureReason = "the network thread does not run";
        // Never from inside `start`, so never on the caller's thread.
        postEnd(NetworkTask::NO_RESPONSE);
    }
}

void Exchange::attempt() {
    if (const boost::shared_ptr<Transfer> next = makeTransfer()) {
        transport->start(next);
    }
}

boost::shared_ptr<Transfer> Exchange::makeTransfer() {
    const Util::EventLock lock;
    const boost::shared_ptr<NetworkTask> current = task;
    if (!isHeard() || !prepareTask(current)) {
        return nullptr;
    }
    ++attempts;
    const boost::shared_ptr<HttpRequest> request = current->issueRequest();
    if (!active) {
        return nullptr;
    }
    const std::string fault = findFault(request);
    if (!fault.empty()) {
        kdLogFormatMessage("Network: a request cannot be sent: %s", fault.c_str());
        current->failureReason = makeReason("the request cannot be sent: " + fault);
        finish(NetworkTask::NO_REQUEST);
        return nullptr;
    }
    collected.clear();
    attemptReason.clear();
    transfer = boost::make_shared<Transfer>(transport, request, shared_from_this());
    transfer->startWatchdog();
    return transfer;
}

bool Exchange::prepareTask(const boost::shared_ptr<NetworkTask>& current) {
    if (attempts > 0) {
        current->onRetried();
    } else if (!current->isReadyToPerform() && active) {
        current->failureReason = "the request is not ready";
        finish(NetworkTask::NOT_READY);
        return false;
    }
    return active;
}

void Exchange::onTransferHead(const boost::shared_ptr<HttpResponse>& response) {
    const Util::EventLock lock;
    const boost::shared_ptr<NetworkTask> current = task;
    if (isHeard()) {
        attemptReason = describeStatus(*response);
        current->onResponseRecieved(response);
    }
}

bool Exchange::onTransferBytes(const unsigned char* bytes, std::size_t size) {
    const Util::EventLock lock;
    const boost::shared_ptr<NetworkTask> current = task;
    if (!isHeard()) {
        return false;
    }
    const bool byParts = current->recieveResponseBodyByParts();
    if (!active) {
        return false;
    }
    if (!byParts) {
        return collect(bytes, size);
    }
    current->onBytesReceived(std::vector<unsigned char>(bytes, bytes + size));
    return active;
}

bool Exchange::collect(const unsigned char* bytes, std::size_t size) {
    if (size > MOST_COLLECTED_BYTES - collected.size()) {
        kdLogMessage("Network: the body of a response is too large");
        attemptReason = "the body of the response is too large";
        return false;
    }
    collected.insert(collected.end(), bytes, bytes + size);
    return true;
}

void Exchange::onTransferEnd(const TransferEnd& how) {
    const Util::EventLock lock;
    const boost::shared_ptr<NetworkTask> current = task;
    if (!isHeard()) {
        return;
    }
    transfer.reset();
    // Ours is more precise than what libcurl says about an end that we caused.
    current->failureReason = attemptReason.empty() ? how.reason : attemptReason;
    if (how.code > 0 && !collected.empty()) {
        const std::vector<unsigned char> whole = std::move(collected);
        current->onBytesReceived(whole);
    }
    if (active) {
        retryOrFinish(how.code);
    }
}

void Exchange::retryOrFinish(int code) {
    const bool final = code == NetworkTask::NO_REQUEST || transport->isStopping() || !policy;
    const int64_t delayMs = final ? -1 : policy->getRetryDelayMs(code, attempts);
    if (delayMs < 0) {
        finish(code);
    } else if (delayMs == 0) {
        postAttempt();
    } else {
        retryTimer.start(KD_TIMER_ONESHOT, delayMs * NS_PER_MS);
    }
}

void Exchange::finish(int code) {
    if (endsHere) {
        deliverEnd(code);
    } else {
        postEnd(code);
    }
}

void Exchange::postEnd(int code) {
    const boost::shared_ptr<Exchange> self = shared_from_this();
    postToEventThread([self, code] { self->deliverEnd(code); });
}

void Exchange::deliverEnd(int code) {
    const boost::shared_ptr<NetworkTask> current = task;
    if (isHeard()) {
        current->onFinished(code);
        cancel();
    }
}

// At the end of the process nothing is delivered any more, whatever becomes of the transfers.
bool Exchange::isHeard() const {
    return active && kdEventsHaveEndedKOR() == 0;
}

}  // namespace Network
