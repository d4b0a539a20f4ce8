// One thread owns libcurl: the multi handle, the transfers, the connections that are kept, the
// sockets. Other threads leave commands for it under the mutex and wake it; `awake` spares further
// wake-ups until it has looked. It runs one batch of commands, lets libcurl do what sockets and
// libcurl's timers ask for, ends the transfers that are over, and sleeps until there is more.
// Nothing is polled for.
//
// The thread holds no lock while it runs a command or a callback, so that these may take the event
// lock. The mutex may be taken under the event lock, never the other way round.
//
// The thread starts with the first command. Where the system has no thread or no descriptors for
// it, `post` says so, and the next command tries again. `stop` lets it run what it has accepted,
// ends every transfer without a response and closes the connections.
//
// How long a peer keeps us waiting is measured on the platform clock, by each transfer's watchdog.
// When one is due on the event thread, this thread first takes what has arrived meanwhile
// (`check`): an answer that lies in the socket is an answer in time.
#include "network/curl/CurlTransport.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <chrono>
#include <exception>
#include <new>
#include <utility>

#include "core/network/NetworkTask.h"
#include "network/curl/CurlTransfer.h"
#include "pal/SignalsBlocked.h"
#include "pal/kd_assert.h"
#include "pal/kd_event.h"
#include "pal/kd_log.h"

namespace Network {

namespace {

// Nothing is polled for: the thread is woken by sockets, by libcurl's own timers and by commands.
constexpr int LONGEST_SLEEP_MS = 60 * 60 * 1000;
constexpr std::chrono::seconds STOP_LIMIT{2};

void initialiseCurl() {
    static std::once_flag once;
    // For the rest of the process: the application may use libcurl as well.
    std::call_once(once, [] {
        if (curl_global_init(CURL_GLOBAL_DEFAULT) != CURLE_OK) {
            throw std::bad_alloc();  // the next use tries again
        }
    });
}

/** Releases the event lock for its own lifetime, however often it is held. */
class EventLockLoan {
  public:
    EventLockLoan() {
        while (kdHoldsEventLockKOR() != 0) {
            kdEventUnlockKOR();
            ++levels;
        }
    }
    ~EventLockLoan() {
        for (; levels > 0; --levels) {
            kdEventLockKOR();
        }
    }
    EventLockLoan(const EventLockLoan&) = delete;
    EventLockLoan& operator=(const EventLockLoan&) = delete;

  private:
    int levels = 0;
};

TransferEnd judge(const CurlTransfer& transfer, CURLcode result) noexcept {
    try {
        return transfer.judge(result);
    } catch (const std::exception&) {
        return {NetworkTask::NO_RESPONSE, {}};
    }
}

}  // namespace

CurlTransport::CurlTransport() {
    initialiseCurl();
}

CurlTransport::~CurlTransport() = default;

bool CurlTransport::post(std::function<void()> command) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (!takesCommands()) {
        return false;
    }
    commands.push_back(std::move(command));
    wakeFromOutside();
    return true;
}

boost::shared_ptr<Transfer> CurlTransport::makeTransfer(
    const boost::shared_ptr<HttpRequest>& request,
    const boost::shared_ptr<TransferListener>& listener) {
    const auto transfer = boost::make_shared<CurlTransfer>(shared_from_this(), request, listener);
    transfer->startWatchdog();
    return transfer;
}

void CurlTransport::requestResume(const boost::shared_ptr<CurlTransfer>& transfer) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (takesCommands()) {
        resumed.push_back(transfer);
        wakeFromOutside();
    }
}

bool CurlTransport::takesCommands() {
    return !closed && kdEventsHaveEndedKOR() == 0 && launchThread();
}

void CurlTransport::wakeFromOutside() {
    if (thread.get_id() != std::this_thread::get_id()) {
        wake();
    }
}

// A wake-up that fails is tried again with the next command.
void CurlTransport::wake() {
    awake = awake || curl_multi_wakeup(multi.get()) == CURLM_OK;
}

void CurlTransport::requestCheck(const boost::shared_ptr<CurlTransfer>& transfer) {
    const boost::shared_ptr<CurlTransport> self = shared_from_this();
    post([self, transfer] { self->check(transfer); });
}

void CurlTransport::setCertificateFile(const std::string& path) {
    const std::lock_guard<std::mutex> lock(mutex);
    certificateFile = path;
}

void CurlTransport::stop() {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        // Not earlier: the thread could end, and free what is woken here.
        stopping = true;
        if (!thread.joinable()) {
            closed = true;
            return;
        }
        wake();
    }
    // A task's callback must not end the thread that it runs on, unless it ends the process.
    const bool isOwnThread = thread.get_id() == std::this_thread::get_id();
    if (isOwnThread && kdEventsHaveEndedKOR() == 0) {
        KOR_ASSERT(!isOwnThread);
    }
    if (isOwnThread) {
        thread.detach();
        return;
    }
    const EventLockLoan loan;
    if (waitForEnd()) {
        thread.join();
    } else {
        kdLogMessage("Network: the network thread hangs and is left behind");
        thread.detach();
    }
}

bool CurlTransport::waitForEnd() {
    std::unique_lock<std::mutex> lock(mutex);
    return changed.wait_for(lock, STOP_LIMIT, [this] { return finished; });
}

// Without free descriptors libcurl makes a handle that cannot be woken: it is not kept.
bool CurlTransport::launchThread() {
    if (thread.joinable()) {
        return true;
    }
    multi.reset(curl_multi_init());
    if (!multi || curl_multi_wakeup(multi.get()) != CURLM_OK) {
        multi.reset();
        kdLogMessage("Network: no descriptors or memory for the network thread");
        return false;
    }
    const korvel_pal::SignalsBlocked signalsBlocked;
    const boost::shared_ptr<CurlTransport> self = shared_from_this();
    try {
        thread = std::thread([self] { self->run(); });
    } catch (const std::exception& error) {
        kdLogFormatMessage("Network: the network thread cannot start: %s", error.what());
        multi.reset();
        return false;
    }
    return true;
}

void CurlTransport::run() {
    while (runCommands()) {
        perform();
        if (!isWanted()) {
            curl_multi_poll(multi.get(), nullptr, 0, LONGEST_SLEEP_MS, nullptr);
        }
    }
    finishAll();
    // Closes the connections that were kept.
    multi.reset();
    const std::lock_guard<std::mutex> lock(mutex);
    finished = true;
    changed.notify_all();
}

// The end counts, too: `stop` may have come before the last batch, without a wake-up of its own.
bool CurlTransport::isWanted() {
    const std::lock_guard<std::mutex> lock(mutex);
    return !commands.empty() || !resumed.empty() || stopping;
}

// One batch at a time: transfers go on between commands that come in quick succession. The end
// comes when nothing is left to run, so that each command that was accepted is run.
bool CurlTransport::runCommands() {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        awake = false;
        currentCommands.swap(commands);
        currentResumed.swap(resumed);
        closed = stopping && currentCommands.empty() && currentResumed.empty();
        if (closed) {
            return false;
        }
    }
    for (const std::function<void()>& command : currentCommands) {
        try {
            command();
        } catch (const std::exception& exception) {
            kdReportExceptionKOR(exception.what());
        } catch (...) {
            kdReportExceptionKOR(nullptr);
        }
    }
    currentCommands.clear();
    for (const boost::shared_ptr<CurlTransfer>& transfer : currentResumed) {
        transfer->resume();
    }
    currentResumed.clear();
    return true;
}

void CurlTransport::perform() {
    int running = 0;
    curl_multi_perform(multi.get(), &running);
    int waiting = 0;
    while (const CURLMsg* message = curl_multi_info_read(multi.get(), &waiting)) {
        const auto entry = transfers.find(message->easy_handle);
        if (message->msg == CURLMSG_DONE && entry != transfers.end()) {
            finish(entry, message->data.result);
        }
    }
}

void CurlTransport::start(const boost::shared_ptr<CurlTransfer>& transfer) {
    std::string certificates;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        certificates = certificateFile;
    }
    CURL* const easy = transfer->open(certificates);
    if (easy == nullptr) {
        transfer->end(judge(*transfer, CURLE_OUT_OF_MEMORY));
        return;
    }
    const auto entry = transfers.emplace(easy, transfer).first;
    if (curl_multi_add_handle(multi.get(), easy) != CURLM_OK) {
        finish(entry, CURLE_FAILED_INIT);
    }
}

void CurlTransport::requestAbandon(const boost::shared_ptr<CurlTransfer>& transfer) noexcept {
    try {
        const boost::shared_ptr<CurlTransport> self = shared_from_this();
        post([self, transfer] { self->abandon(transfer); });
    } catch (const std::exception&) {
        kdLogMessage("Network: no memory to end a transfer at once");
        transfer->endSoon();
    }
}

void CurlTransport::abandon(const boost::shared_ptr<CurlTransfer>& transfer) {
    const auto entry = find(transfer);
    if (entry != transfers.end()) {
        curl_multi_remove_handle(multi.get(), entry->first);
        transfers.erase(entry);
    }
    transfer->abandon();
}

// What has arrived but was not looked at yet counts for the peer.
void CurlTransport::check(const boost::shared_ptr<CurlTransfer>& transfer) {
    perform();
    const auto entry = find(transfer);
    if (entry != transfers.end() && transfer->hasExpired()) {
        finish(entry, CURLE_OPERATION_TIMEDOUT);
    }
}

void CurlTransport::finish(Transfers::iterator entry, CURLcode result) {
    const boost::shared_ptr<CurlTransfer> transfer = entry->second;
    curl_multi_remove_handle(multi.get(), entry->first);
    if (transfer->takeNewConnection() &&
        curl_multi_add_handle(multi.get(), entry->first) == CURLM_OK) {
        return;
    }
    handles.noteEnd(result);
    const TransferEnd how = judge(*transfer, result);
    transfers.erase(entry);
    transfer->end(how);
}

void CurlTransport::finishAll() {
    while (!transfers.empty()) {
        finish(transfers.begin(), CURLE_ABORTED_BY_CALLBACK);
    }
}

CurlTransport::Transfers::iterator CurlTransport::find(
    const boost::shared_ptr<CurlTransfer>& transfer) {
    return std::find_if(
        transfers.begin(), transfers.end(),
        [&transfer](const Transfers::value_type& entry) { return entry.second == transfer; });
}

}  // namespace Network
