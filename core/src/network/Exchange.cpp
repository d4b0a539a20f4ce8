// An exchange has two sides. Its owner starts and cancels it under the event lock, on any thread.
// The transport's thread runs the attempts, and takes the event lock for every call to the task.
// Whoever comes with the lock first asks `mayDeliver`: after `cancel`, and once deliveries have
// ended with the process, the task hears nothing any more, whatever the transport is still doing.
//
// An attempt goes from `postAttempt` over the transport's thread (`attempt`, `makeTransfer`) to the
// transfer, which reports head, bytes and end. The end leads to another attempt, at once or when
// the retry timer is due, or to `finish`. The task's end is told once, on the event thread or, for
// holders that want it so, on the transport's.
//
// Each call from the transport may throw, because tasks are anybody's code: `callTask` turns that
// into an end without a response and without a retry. Nothing is ever left without an end: an
// attempt that cannot even be posted ends by the event thread, and an end that cannot be posted is
// told where it was found.
#include "network/Exchange.h"

#include <algorithm>
#include <exception>
#include <new>
#include <utility>

#include "core/network/TransferTrace.h"
#include "core/util/EventLock.h"
#include "core/util/Time.h"
#include "network/FailureText.h"
#include "network/RequestCheck.h"
#include "pal/kd_event.h"
#include "pal/kd_log.h"

namespace Network {

namespace {

constexpr std::size_t MOST_COLLECTED_BYTES = std::size_t{1024} * 1024;
using Util::NS_PER_MS;

}  // namespace

Exchange::Exchange(boost::shared_ptr<Transport> owner, boost::shared_ptr<NetworkTask> what,
                   boost::shared_ptr<NetworkTaskRetryPolicy> when, bool endHere)
    : transport(std::move(owner)),
      task(std::move(what)),
      policy(std::move(when)),
      endsHere(endHere),
      retryTimer([this] { retry(); }) {}

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
        ended->cancel();
    }
    policy.reset();
    // Last: the task's destructor may do anything.
    task.reset();
}

void Exchange::retry() {
    if (!callTask([this] { postAttempt(); })) {
        endWithException();
    }
}

void Exchange::postAttempt() {
    const boost::shared_ptr<Exchange> self = shared_from_this();
    if (transport->post([self] { self->attempt(); })) {
        return;
    }
    task->failureReason = "the network thread does not run";
    // Never from inside `start`, so never on the caller's thread.
    if (!postEnd(NetworkTask::NO_RESPONSE)) {
        throw std::bad_alloc();
    }
}

template <typename Call>
bool Exchange::callTask(Call call) noexcept {
    try {
        call();
        return true;
    } catch (const std::exception& exception) {
        noteException(exception.what());
    } catch (...) {
        noteException("an exception of an unknown type");
    }
    return false;
}

void Exchange::noteException(const char* what) noexcept {
    kdLogFormatMessage("Network: a task cannot go on: %s", what);
    const Util::EventLock lock;
    try {
        attemptReason = makeReason(what);
    } catch (const std::exception&) {
        attemptReason.clear();
    }
}

void Exchange::attempt() {
    const bool begun = callTask([this] {
        if (const boost::shared_ptr<Transfer> next = makeTransfer()) {
            next->start();
        }
    });
    if (!begun) {
        endWithException();
    }
}

// The last resort: no retry, whose way would lead through the same want.
void Exchange::endWithException() noexcept {
    const Util::EventLock lock;
    if (!mayDeliver()) {
        return;
    }
    callTask([this] { task->failureReason.swap(attemptReason); });
    callTask([this] { finish(NetworkTask::NO_RESPONSE); });
}

boost::shared_ptr<Transfer> Exchange::makeTransfer() {
    const Util::EventLock lock;
    const boost::shared_ptr<NetworkTask> current = task;
    if (!mayDeliver() || !prepareTask(current)) {
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
    transfer = transport->makeTransfer(request, chooseListener(*current, *request));
    return transfer;
}

boost::shared_ptr<TransferListener> Exchange::chooseListener(NetworkTask& current,
                                                             const HttpRequest& request) {
    auto* const tap = dynamic_cast<TransferTap*>(&current);
    return tap != nullptr ? tap->tapTransfer(request, shared_from_this()) : shared_from_this();
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

bool Exchange::onTransferHead(const boost::shared_ptr<HttpResponse>& response) {
    const Util::EventLock lock;
    const boost::shared_ptr<NetworkTask> current = task;
    return callTask([&] {
        if (mayDeliver()) {
            attemptReason = describeStatus(*response);
            current->onResponseRecieved(response);
        }
    });
}

bool Exchange::onTransferBytes(const unsigned char* bytes, std::size_t size) {
    const Util::EventLock lock;
    bool wanted = false;
    return callTask([&] { wanted = takeBytes(bytes, size); }) && wanted;
}

bool Exchange::takeBytes(const unsigned char* bytes, std::size_t size) {
    const boost::shared_ptr<NetworkTask> current = task;
    if (!mayDeliver()) {
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
    transfer.reset();
    if (!callTask([&] { takeEnd(how); })) {
        endWithException();
    }
}

void Exchange::takeEnd(const TransferEnd& how) {
    const boost::shared_ptr<NetworkTask> current = task;
    if (!mayDeliver()) {
        return;
    }
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

// Where there is no way to the event thread the end is delivered here, under the same lock.
void Exchange::finish(int code) {
    if (endsHere || !postEnd(code)) {
        deliverEnd(code);
    }
}

bool Exchange::postEnd(int code) {
    if (posted) {
        return true;
    }
    posted = shared_from_this();
    postedCode = code;
    const bool isOnItsWay = kdPostKOR(&Exchange::onPosted, this) == 0;
    if (!isOnItsWay) {
        posted.reset();
    }
    return isOnItsWay;
}

void Exchange::onPosted(void* user) {
    const boost::shared_ptr<Exchange> self = std::move(static_cast<Exchange*>(user)->posted);
    self->deliverEnd(self->postedCode);
}

void Exchange::deliverEnd(int code) {
    const boost::shared_ptr<NetworkTask> current = task;
    if (!mayDeliver()) {
        return;
    }
    try {
        current->onFinished(code);
    } catch (...) {
        cancel();
        throw;
    }
    cancel();
}

// At the end of the process nothing is delivered any more, whatever becomes of the transfers.
bool Exchange::mayDeliver() const {
    return active && kdEventsHaveEndedKOR() == 0;
}

}  // namespace Network
