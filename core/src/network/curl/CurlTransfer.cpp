#include "network/curl/CurlTransfer.h"

#include <algorithm>
#include <boost/weak_ptr.hpp>
#include <cstddef>
#include <limits>
#include <string_view>
#include <utility>

#include "core/network/NetworkTask.h"
#include "network/FailureText.h"
#include "network/curl/CurlGuard.h"
#include "network/curl/CurlTransport.h"
#include "pal/kd_log.h"

namespace Network {

namespace {

// The time-outs are ours, on the platform clock.
constexpr long NO_CONNECT_LIMIT_MS = std::numeric_limits<int>::max();
constexpr long MOST_REDIRECTS = 10;
constexpr int64_t NS_PER_US = 1000;

/** Options that this libcurl does not know are no obstacle; any other refusal is. */
bool isSet(CURLcode code) {
    return code == CURLE_OK || code == CURLE_UNKNOWN_OPTION || code == CURLE_NOT_BUILT_IN;
}

bool isPlain(char c) {
    return c > ' ' && c < '\x7F';
}

/**
 * The target of a request that has a query: what follows the host. "" if libcurl must find it,
 * because there is no query or a character of the path is sent encoded.
 */
std::string makeTarget(const std::string& url) {
    const std::size_t query = url.find('?');
    if (query == std::string::npos) {
        return {};
    }
    const std::size_t host = url.find_first_not_of('/', url.find("://") + 1);
    const std::size_t path = std::min(url.find('/', host), query);
    const auto at = [&url](std::size_t i) { return url.begin() + static_cast<std::ptrdiff_t>(i); };
    if (!std::all_of(at(path), at(query), &isPlain)) {
        return {};
    }
    return (path == query ? "/" : "") + url.substr(path);
}

bool isSecure(const std::string& url) {
    return url.size() > 4 && (url[4] == 's' || url[4] == 'S');
}

}  // namespace

CurlTransfer::CurlTransfer(boost::shared_ptr<CurlTransport> owner,
                           boost::shared_ptr<HttpRequest> what,
                           boost::shared_ptr<TransferListener> hearer)
    : transport(std::move(owner)),
      request(std::move(what)),
      listener(std::move(hearer)),
      trace(dynamic_cast<TransferTrace*>(listener.get())),
      watchdog(request->getTimeoutMs(),
               [this] {
                   if (const boost::shared_ptr<CurlTransfer> self = weak_from_this().lock()) {
                       transport->requestCheck(self);
                   }
               }),
      body(request) {}

void CurlTransfer::start() {
    transport->start(shared_from_this());
}

void CurlTransfer::cancel() noexcept {
    transport->requestAbandon(shared_from_this());
}

CURL* CurlTransfer::open(const std::string& certificateFile) {
    handle = transport->getHandles().take(certificateFile);
    isSetUp = static_cast<bool>(handle.easy);
    if (isSetUp) {
        setUpRequest();
        setUpHeaders();
    }
    if (!isSetUp) {
        handle.easy.reset();  // half set up, it must not serve again
    }
    return handle.easy.get();
}

bool CurlTransfer::setUpHandle(CURL* easy) {
    bool isDone = true;
    const auto setOption = [easy, &isDone](CURLoption option, auto value) {
        isDone = isDone && isSet((curl_easy_setopt)(easy, option, value));
    };
    setOption(CURLOPT_NOSIGNAL, 1L);
    // Otherwise the end of a transfer waits for a name server that does not answer.
    setOption(CURLOPT_QUICK_EXIT, 1L);
    setOption(CURLOPT_CONNECTTIMEOUT_MS, NO_CONNECT_LIMIT_MS);
    // Settings come from the application only, never from the environment.
    setOption(CURLOPT_PROXY, "");
    setOption(CURLOPT_HTTP_VERSION, static_cast<long>(CURL_HTTP_VERSION_1_1));
    setOption(CURLOPT_SSLVERSION, static_cast<long>(CURL_SSLVERSION_TLSv1_2));
    setOption(CURLOPT_PATH_AS_IS, 1L);
    setOption(CURLOPT_PROTOCOLS_STR, "http,https");
    setOption(CURLOPT_MAXREDIRS, MOST_REDIRECTS);
    setOption(CURLOPT_NOPROGRESS, 0L);
    setOption(CURLOPT_PREREQFUNCTION, &CurlTransfer::onConnection);
    setOption(CURLOPT_XFERINFOFUNCTION, &CurlTransfer::onProgress);
    setOption(CURLOPT_HEADERFUNCTION, &CurlTransfer::onHeader);
    setOption(CURLOPT_WRITEFUNCTION, &CurlTransfer::onWrite);
    setOption(CURLOPT_READFUNCTION, &CurlTransfer::onRead);
    setOption(CURLOPT_SEEKFUNCTION, &CurlTransfer::onSeek);
    return isDone;
}

template <typename Value>
void CurlTransfer::set(CURLoption option, Value value) {
    isSetUp = isSetUp && isSet((curl_easy_setopt)(handle.easy.get(), option, value));
}

// Each request sets all of these, whatever its method: the last one's are still there.
void CurlTransfer::setUpRequest() {
    for (const CURLoption option : {CURLOPT_PREREQDATA, CURLOPT_XFERINFODATA, CURLOPT_HEADERDATA,
                                    CURLOPT_WRITEDATA, CURLOPT_READDATA, CURLOPT_SEEKDATA}) {
        set(option, this);
    }
    set(CURLOPT_ERRORBUFFER, errorText.data());
    set(CURLOPT_FRESH_CONNECT, 0L);
    setUpAddress();
    if (request->getMethod() == "POST") {
        setUpBody();
    } else {
        set(CURLOPT_HTTPGET, 1L);
    }
}

// libcurl takes an address apart and puts it together again, character by character. For a usage
// record, whose text is the query, that costs more than all that we do. A query has no syntax, so
// libcurl gets it as a part of the target only. After a redirect the target is another one.
void CurlTransfer::setUpAddress() {
    const std::string& url = request->getUrl();
    const bool mayBeRedirected = request->getMethod() != "POST" && request->getFollowRedirects();
    const std::string target = mayBeRedirected ? std::string() : makeTarget(url);
    const std::string address = target.empty() ? url : url.substr(0, url.find('?'));
    set(CURLOPT_URL, address.c_str());
    set(CURLOPT_REQUEST_TARGET, target.empty() ? nullptr : target.c_str());
    set(CURLOPT_FOLLOWLOCATION, mayBeRedirected ? 1L : 0L);
    set(CURLOPT_REDIR_PROTOCOLS_STR, isSecure(url) ? "https" : "http,https");
}

void CurlTransfer::setUpBody() {
    set(CURLOPT_POST, 1L);
    if (request->isChunked()) {
        const boost::weak_ptr<CurlTransfer> weak(shared_from_this());
        request->getWriter()->setWakeUp([weak] {
            if (const boost::shared_ptr<CurlTransfer> self = weak.lock()) {
                self->wake();
            }
        });
    }
    set(CURLOPT_POSTFIELDSIZE_LARGE,
        request->isChunked() ? curl_off_t{-1} : static_cast<curl_off_t>(request->getBody().size()));
}

void CurlTransfer::setUpHeaders() {
    bool hasContentType = false;
    for (const auto& header : request->getHeaders()) {
        // Without a value, a colon would tell libcurl to leave the header out.
        addHeaderLine(header.second.empty() ? header.first + ";"
                                            : header.first + ": " + header.second);
        hasContentType = hasContentType || curl_strequal(header.first.c_str(), "Content-Type") != 0;
    }
    if (request->getMethod() == "POST") {
        addHeaderLine("Expect:");  // none: waiting for its answer costs a second
        if (request->isChunked()) {
            addHeaderLine("Transfer-Encoding: chunked");
        }
        if (!hasContentType) {
            addHeaderLine("Content-Type:");  // none, instead of libcurl's default
        }
    }
    set(CURLOPT_HTTPHEADER, headerLines.get());
}

void CurlTransfer::addHeaderLine(const std::string& line) {
    curl_slist* const longer = curl_slist_append(headerLines.get(), line.c_str());
    if (longer == nullptr) {
        isSetUp = false;
        return;
    }
    static_cast<void>(headerLines.release());
    headerLines.reset(longer);
}

TransferEnd CurlTransfer::judge(CURLcode result) const {
    const long status = getStatus();
    if (headDelivered && (result == CURLE_OK || isAnswered())) {
        return {static_cast<int>(status), {}};
    }
    const std::string reason = makeReason(describe(result));
    kdLogFormatMessage("Network: a request failed: %s", reason.c_str());
    if (result == CURLE_OPERATION_TIMEDOUT) {
        return {NetworkTask::TIMED_OUT, reason};
    }
    const bool neverSent = result == CURLE_URL_MALFORMAT && status == 0;
    return {neverSent ? NetworkTask::NO_REQUEST : NetworkTask::NO_RESPONSE, reason};
}

std::string CurlTransfer::describe(CURLcode result) const {
    if (refusal != nullptr) {
        return refusal;
    }
    if (!handle.easy) {
        return "no memory for the request";
    }
    if (result == CURLE_OPERATION_TIMEDOUT) {
        return describeTimeout(request->getTimeoutMs());
    }
    // libcurl calls a header line beyond its limit so.
    if (result == CURLE_OUT_OF_MEMORY && getStatus() != 0 && !headDelivered) {
        return "the head of the response is too large, or memory is short";
    }
    return errorText[0] != '\0' ? errorText.data() : curl_easy_strerror(result);
}

long CurlTransfer::getStatus() const {
    long status = 0;
    if (!handle.easy) {
        return status;
    }
    curl_easy_getinfo(handle.easy.get(), CURLINFO_RESPONSE_CODE, &status);
    return status;
}

// A peer that has answered may close the connection without listening to the end.
bool CurlTransfer::isAnswered() const {
    curl_off_t expected = -1;
    curl_easy_getinfo(handle.easy.get(), CURLINFO_CONTENT_LENGTH_DOWNLOAD_T, &expected);
    return expected >= 0 && receivedBytes >= expected;
}

void CurlTransfer::end(const TransferEnd& how) {
    const boost::shared_ptr<TransferListener> hearer = listener;
    traceConnection();
    abandon();
    if (hearer) {
        hearer->onTransferEnd(how);
    }
}

void CurlTransfer::abandon() {
    if (listener && request->isChunked()) {
        request->getWriter()->setWakeUp({});
    }
    watchdog.stop();
    trace = nullptr;
    listener.reset();
    if (handle.easy) {
        transport->getHandles().giveBack(std::move(handle));
    }
}

// Writes may come faster than the network thread wakes up: one command serves them all.
void CurlTransfer::wake() {
    if (!wakeUpPosted.exchange(true)) {
        transport->requestResume(shared_from_this());
    }
}

void CurlTransfer::resume() {
    wakeUpPosted = false;
    if (handle.easy && paused) {
        paused = false;
        watchdog.progress();
        curl_easy_pause(handle.easy.get(), CURLPAUSE_CONT);
    }
}

std::size_t CurlTransfer::readBody(char* data, std::size_t size) {
    std::size_t count = 0;
    // Once the answer is there, nobody waits for the rest: an early end keeps the connection.
    const bool cutShort = headDelivered && request->isChunked();
    switch (cutShort ? RequestBody::State::END : body.read(data, size, count)) {
        case RequestBody::State::NOTHING_YET:
            paused = true;
            watchdog.pause();
            return CURL_READFUNC_PAUSE;
        case RequestBody::State::BYTES:
        case RequestBody::State::END:
            break;
    }
    watchdog.progress();
    if (trace != nullptr && count > 0) {
        trace->onTransferPiece(count);
    }
    return count;
}

// While we have nothing to send, the peer owes us nothing, whatever it says.
void CurlTransfer::noteProgress() {
    if (!paused) {
        watchdog.progress();
    }
}

bool CurlTransfer::handleHeadEnd() {
    const long status = getStatus();
    const bool interim = status < 200;
    const bool redirected = status >= 300 && status < 400 && request->getMethod() != "POST" &&
                            request->getFollowRedirects() && head.has("Location");
    if (headDelivered || interim || redirected) {
        return true;
    }
    if (paused) {
        wake();
    }
    headDelivered = listener->onTransferHead(head.makeResponse(static_cast<int>(status)));
    return headDelivered;
}

// On a kept connection something may have arrived since the last answer: whatever it is, it would
// be taken for the answer to this request. libcurl looks at that only since late versions.
bool CurlTransfer::canUseConnection(int ownPort) {
    long connectionsMade = 0;
    curl_easy_getinfo(handle.easy.get(), CURLINFO_NUM_CONNECTS, &connectionsMade);
    needsNewConnection =
        connectionsMade == 0 && transport->getHandles().getSockets().hasArrivals(ownPort);
    if (!needsNewConnection) {
        traceConnection();
    }
    return !needsNewConnection;
}

void CurlTransfer::traceConnection() {
    if (trace == nullptr || connectionTraced) {
        return;
    }
    connectionTraced = true;
    TransferConnection connection;
    long connectionsMade = 0;
    if (handle.easy) {
        curl_easy_getinfo(handle.easy.get(), CURLINFO_NUM_CONNECTS, &connectionsMade);
    }
    connection.isNew = connectionsMade > 0;
    if (connection.isNew) {
        connection.lookupNs = getStageNs(CURLINFO_NAMELOOKUP_TIME_T);
        connection.connectedNs = getStageNs(CURLINFO_CONNECT_TIME_T);
        connection.tlsNs = getStageNs(CURLINFO_APPCONNECT_TIME_T);
    }
    trace->onTransferConnection(connection);
}

// libcurl counts in microseconds and says 0 for a stage that it has not passed.
int64_t CurlTransfer::getStageNs(CURLINFO stage) const {
    curl_off_t microseconds = 0;
    curl_easy_getinfo(handle.easy.get(), stage, &microseconds);
    return microseconds > 0 ? microseconds * NS_PER_US : TransferConnection::NONE;
}

bool CurlTransfer::takeNewConnection() {
    const bool needed = needsNewConnection;
    if (needed) {
        needsNewConnection = false;
        errorText[0] = '\0';
        kdLogMessage("Network: there is something unasked on a kept connection, taking a new one");
        curl_easy_setopt(handle.easy.get(), CURLOPT_FRESH_CONNECT, 1L);
    }
    return needed;
}

int CurlTransfer::onConnection(void* self, char*, char*, int, int ownPort) {
    return guardForCurl(CURL_PREREQFUNC_ABORT, [self, ownPort] {
        return static_cast<CurlTransfer*>(self)->canUseConnection(ownPort) ? CURL_PREREQFUNC_OK
                                                                           : CURL_PREREQFUNC_ABORT;
    });
}

std::size_t CurlTransfer::onRead(char* data, std::size_t size, std::size_t count, void* self) {
    return guardForCurl(std::size_t{CURL_READFUNC_ABORT}, [=] {
        return static_cast<CurlTransfer*>(self)->readBody(data, size * count);
    });
}

int CurlTransfer::onSeek(void* self, curl_off_t offset, int origin) {
    if (origin != SEEK_SET || offset < 0) {
        return CURL_SEEKFUNC_CANTSEEK;
    }
    static_cast<CurlTransfer*>(self)->body.seek(static_cast<std::size_t>(offset));
    return CURL_SEEKFUNC_OK;
}

std::size_t CurlTransfer::onHeader(char* data, std::size_t size, std::size_t count, void* self) {
    return guardForCurl(std::size_t{0}, [=] {
        return static_cast<CurlTransfer*>(self)->takeHeaderLine(data, size * count);
    });
}

std::size_t CurlTransfer::takeHeaderLine(const char* data, std::size_t size) {
    noteProgress();
    if (!head.hasRoom(size)) {
        kdLogMessage("Network: the head of a response is too large");
        refusal = "the head of the response is too large";
        return 0;
    }
    const bool isWanted = !head.addLine(std::string_view(data, size)) || handleHeadEnd();
    return isWanted ? size : 0;
}

std::size_t CurlTransfer::onWrite(char* data, std::size_t size, std::size_t count, void* self) {
    CurlTransfer& transfer = *static_cast<CurlTransfer*>(self);
    transfer.noteProgress();
    const std::size_t bytes = size * count;
    const auto* const start = reinterpret_cast<const unsigned char*>(data);
    if (!transfer.listener->onTransferBytes(start, bytes)) {
        return CURL_WRITEFUNC_ERROR;
    }
    transfer.receivedBytes += static_cast<curl_off_t>(bytes);
    return bytes;
}

int CurlTransfer::onProgress(void* self, curl_off_t, curl_off_t downNow, curl_off_t,
                             curl_off_t upNow) {
    CurlTransfer& transfer = *static_cast<CurlTransfer*>(self);
    const curl_off_t moved = downNow + upNow;
    if (moved != transfer.movedBytes) {
        transfer.movedBytes = moved;
        transfer.noteProgress();
    }
    return transfer.unwanted ? 1 : 0;
}

}  // namespace Network
