#include "HttpProbe.h"

#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <new>

#include "core/util/Ascii.h"
#include "core/util/Time.h"
#include "pal/kd_time.h"

namespace Cli {

namespace {

using Util::NS_PER_MS;

const std::size_t BODY_MAX_BYTES = 4096;
/** How long libcurl may sleep before the probe looks at the clock again. */
const int POLL_MS = 100;

double toMs(int64_t nanoseconds) {
    return static_cast<double>(nanoseconds) / static_cast<double>(NS_PER_MS);
}

/** libcurl must be set up once a process; it is never taken down, like the library's own use. */
void initialise() {
    static const CURLcode code = curl_global_init(CURL_GLOBAL_DEFAULT);
    if (code != CURLE_OK) {
        throw std::bad_alloc();
    }
}

std::string trimmed(const std::string& text) {
    const std::size_t begin = text.find_first_not_of(" \t\r\n");
    const std::size_t end = text.find_last_not_of(" \t\r\n");
    return begin == std::string::npos ? "" : text.substr(begin, end - begin + 1);
}

}  // namespace

/** libcurl's calls back; they do not throw. */
struct HttpProbe::Callbacks {
    static std::size_t onRead(char* buffer, std::size_t size, std::size_t count, void* user) {
        return static_cast<HttpProbe*>(user)->give(buffer, size * count);
    }
    static std::size_t onHeader(char* data, std::size_t size, std::size_t count, void* user) {
        static_cast<HttpProbe*>(user)->takeHeader(std::string(data, size * count));
        return size * count;
    }
    static std::size_t onWrite(char* data, std::size_t size, std::size_t count, void* user) {
        auto* const self = static_cast<HttpProbe*>(user);
        self->progressAt = kdGetTimeUST();
        std::string& body = self->answer.body;
        body.append(data, std::min(size * count, BODY_MAX_BYTES - body.size()));
        return size * count;
    }
};

HttpProbe::HttpProbe(const ProbeTarget& probeTarget)
    : target(probeTarget),
      easy((initialise(), curl_easy_init()), &curl_easy_cleanup),
      multi(curl_multi_init(), &curl_multi_cleanup),
      headerLines(nullptr, &curl_slist_free_all) {
    if (!easy || !multi) {
        throw std::bad_alloc();
    }
}

HttpProbe::~HttpProbe() {
    curl_multi_remove_handle(multi.get(), easy.get());
}

template <typename Value>
void HttpProbe::set(CURLoption option, Value value) {
    // The name stands for a macro that checks the types of constant options only.
    if ((curl_easy_setopt)(easy.get(), option, value) == CURLE_OUT_OF_MEMORY) {
        throw std::bad_alloc();
    }
}

void HttpProbe::setUp(const std::string& url) {
    set(CURLOPT_NOSIGNAL, 1L);
    set(CURLOPT_QUICK_EXIT, 1L);
    set(CURLOPT_ERRORBUFFER, errorText);
    set(CURLOPT_URL, url.c_str());
    set(CURLOPT_PATH_AS_IS, 1L);
    set(CURLOPT_PROTOCOLS_STR, "http,https");
    set(CURLOPT_PROXY, "");
    set(CURLOPT_HTTP_VERSION, static_cast<long>(CURL_HTTP_VERSION_1_1));
    set(CURLOPT_SSLVERSION, static_cast<long>(CURL_SSLVERSION_TLSv1_2));
    set(CURLOPT_CONNECTTIMEOUT_MS, static_cast<long>(target.timeoutMs));
    if (!target.certificateFile.empty()) {
        // The folder of the system's authorities stays.
        set(CURLOPT_CAINFO, target.certificateFile.c_str());
    }
}

ProbeResult HttpProbe::connect(bool verifies) {
    setUp(target.url);
    set(CURLOPT_CONNECT_ONLY, 1L);
    set(CURLOPT_CERTINFO, 1L);
    set(CURLOPT_SSL_VERIFYPEER, verifies ? 1L : 0L);
    set(CURLOPT_SSL_VERIFYHOST, verifies ? 2L : 0L);
    return run();
}

std::map<std::string, std::string> HttpProbe::readCertificate() const {
    std::map<std::string, std::string> fields;
    curl_certinfo* chain = nullptr;
    if (curl_easy_getinfo(easy.get(), CURLINFO_CERTINFO, &chain) != CURLE_OK || chain == nullptr ||
        chain->num_of_certs == 0) {
        return fields;
    }
    for (const curl_slist* line = chain->certinfo[0]; line != nullptr; line = line->next) {
        const std::string text = line->data;
        const std::size_t colon = text.find(':');
        if (colon != std::string::npos) {
            fields.emplace(text.substr(0, colon), trimmed(text.substr(colon + 1)));
        }
    }
    return fields;
}

ProbeResult HttpProbe::send(const ProbeRequest& request) {
    setUp(target.url + request.path);
    sending = &request;
    std::size_t length = 0;
    for (const std::string& text : request.pieces) {
        length += text.size();
    }
    const bool isStreamed = request.paceMs >= 0;
    curl_slist* lines = nullptr;
    for (const char* const line :
         {"Content-Type: multipart/form-data; boundary=1BEF0A57BE110FD467A", "Expect:",
          "x-asrgw-arrivals: report", isStreamed ? "Transfer-Encoding: chunked" : nullptr}) {
        curl_slist* const longer = line == nullptr ? lines : curl_slist_append(lines, line);
        if (longer == nullptr) {
            curl_slist_free_all(lines);
            throw std::bad_alloc();
        }
        lines = longer;
    }
    headerLines.reset(lines);
    set(CURLOPT_POST, 1L);
    set(CURLOPT_HTTPHEADER, headerLines.get());
    set(CURLOPT_POSTFIELDSIZE_LARGE, isStreamed ? curl_off_t{-1} : static_cast<curl_off_t>(length));
    set(CURLOPT_READFUNCTION, &Callbacks::onRead);
    set(CURLOPT_READDATA, this);
    set(CURLOPT_HEADERFUNCTION, &Callbacks::onHeader);
    set(CURLOPT_HEADERDATA, this);
    set(CURLOPT_WRITEFUNCTION, &Callbacks::onWrite);
    set(CURLOPT_WRITEDATA, this);
    ProbeResult result = run();
    sending = nullptr;
    return result;
}

ProbeResult HttpProbe::run() {
    answer = ProbeResult();
    piece = 0;
    offset = 0;
    isPaused = false;
    firstPieceAt = 0;
    lastPieceAt = 0;
    answeredAt = 0;
    progressAt = kdGetTimeUST();
    curl_multi_remove_handle(multi.get(), easy.get());
    curl_multi_add_handle(multi.get(), easy.get());
    int running = 1;
    while (running > 0 && !answer.isTimeout) {
        const int waitMs = resume();
        if (curl_multi_perform(multi.get(), &running) != CURLM_OK) {
            throw std::bad_alloc();
        }
        if (running > 0) {
            curl_multi_poll(multi.get(), nullptr, 0, waitMs, nullptr);
            answer.isTimeout = isStalled();
        }
    }
    finish(answer);
    return answer;
}

void HttpProbe::finish(ProbeResult& result) const {
    int left = 0;
    if (const CURLMsg* message = curl_multi_info_read(multi.get(), &left)) {
        result.code = message->data.result;
    }
    result.isTimeout = result.isTimeout || result.code == CURLE_OPERATION_TIMEDOUT;
    result.error = errorText[0] != '\0' ? errorText : curl_easy_strerror(result.code);
    const auto time = [this](CURLINFO info) {
        curl_off_t microseconds = 0;
        curl_easy_getinfo(easy.get(), info, &microseconds);
        return static_cast<double>(microseconds) / 1000;
    };
    const double name = time(CURLINFO_NAMELOOKUP_TIME_T);
    const double connected = time(CURLINFO_CONNECT_TIME_T);
    const double secured = time(CURLINFO_APPCONNECT_TIME_T);
    result.nameMs = name;
    result.isConnected = connected > 0;
    result.connectMs = std::max(0.0, connected - name);
    result.tlsMs = std::max(0.0, secured - connected);
    const char* ip = nullptr;
    curl_easy_getinfo(easy.get(), CURLINFO_PRIMARY_IP, &ip);
    result.ip = ip == nullptr ? "" : ip;
    curl_easy_getinfo(easy.get(), CURLINFO_PRIMARY_PORT, &result.port);
    long number = 0;
    curl_easy_getinfo(easy.get(), CURLINFO_OS_ERRNO, &number);
    result.systemError = static_cast<int>(number);
    curl_easy_getinfo(easy.get(), CURLINFO_SSL_VERIFYRESULT, &result.verifyResult);
    if (result.status != 0) {
        result.isCutShort = lastPieceAt == 0 || answeredAt < lastPieceAt;
        result.streamedMs = toMs(lastPieceAt - firstPieceAt);
        result.answerMs = result.isCutShort ? 0 : toMs(answeredAt - lastPieceAt);
    }
}

bool HttpProbe::isStalled() const {
    // The pause before the next piece is this side's, not the peer's.
    return !isPaused && kdGetTimeUST() - progressAt > target.timeoutMs * NS_PER_MS;
}

/** Sends the next piece if its time has come. @return how long to wait for it, in milliseconds */
int HttpProbe::resume() {
    if (!isPaused) {
        return POLL_MS;
    }
    const int64_t dueAt = firstPieceAt + static_cast<int64_t>(piece) * sending->paceMs * NS_PER_MS;
    const int64_t now = kdGetTimeUST();
    if (now < dueAt) {
        return static_cast<int>(std::min<int64_t>(POLL_MS, (dueAt - now) / NS_PER_MS + 1));
    }
    isPaused = false;
    progressAt = now;
    curl_easy_pause(easy.get(), CURLPAUSE_CONT);
    return 0;
}

std::size_t HttpProbe::give(char* buffer, std::size_t room) {
    const std::vector<std::string>& pieces = sending->pieces;
    progressAt = kdGetTimeUST();
    if (piece == pieces.size()) {
        return 0;
    }
    if (firstPieceAt == 0) {
        firstPieceAt = progressAt;
    }
    const bool isDue = progressAt >= firstPieceAt + static_cast<int64_t>(piece) *
                                                        std::max(sending->paceMs, 0) * NS_PER_MS;
    if (offset == 0 && !isDue) {
        isPaused = true;
        return CURL_READFUNC_PAUSE;
    }
    const std::size_t count = std::min(room, pieces[piece].size() - offset);
    pieces[piece].copy(buffer, count, offset);
    offset += count;
    if (offset == pieces[piece].size()) {
        ++piece;
        offset = 0;
    }
    if (piece == pieces.size()) {
        lastPieceAt = progressAt;
    }
    return count;
}

void HttpProbe::takeHeader(const std::string& line) {
    progressAt = kdGetTimeUST();
    if (line.compare(0, 5, "HTTP/") == 0) {
        answer.headers.clear();
        const std::size_t blank = line.find(' ');
        const int status = blank == std::string::npos ? 0 : std::atoi(line.c_str() + blank);
        // An interim answer (1xx) precedes the one that counts.
        answer.status = status >= 200 ? status : 0;
        answeredAt = progressAt;
        return;
    }
    const std::size_t colon = line.find(':');
    if (colon != std::string::npos) {
        answer.headers.emplace(Util::toLower(line.substr(0, colon)),
                               trimmed(line.substr(colon + 1)));
    }
}

std::optional<double> HttpProbe::waitForClose(int maxMs) const {
    curl_socket_t socket = CURL_SOCKET_BAD;
    curl_easy_getinfo(easy.get(), CURLINFO_ACTIVESOCKET, &socket);
    if (socket == CURL_SOCKET_BAD) {
        return 0;
    }
    const int64_t begin = kdGetTimeUST();
    pollfd connection = {socket, POLLIN | POLLRDHUP, 0};
    while (true) {
        const auto passed = static_cast<int>((kdGetTimeUST() - begin) / NS_PER_MS);
        if (passed >= maxMs) {
            return std::nullopt;
        }
        if (poll(&connection, 1, maxMs - passed) > 0) {
            return toMs(kdGetTimeUST() - begin);
        }
    }
}

}  // namespace Cli
