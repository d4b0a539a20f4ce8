#include "gateway/HttpExchange.h"

#include <microhttpd.h>

#include <cstdlib>

#include "core/util/Ascii.h"
#include "core/util/UrlCoder.h"
#include "gateway/LogText.h"
#include "pal/kd_log.h"
#include "pal/kd_time.h"

namespace Gateway {

namespace {

/** In a request: report in the answer, under the same name, when the body arrived. */
constexpr const char* ARRIVALS_HEADER = "x-asrgw-arrivals";

std::string toText(const char* text) {
    return text == nullptr ? std::string() : text;
}

/** Every "%" introduces two hexadecimal digits. */
bool isWellCoded(const std::string& text) {
    for (std::size_t i = text.find('%'); i != std::string::npos; i = text.find('%', i + 1)) {
        if (text.size() - i < 3 || Util::hexValue(text[i + 1]) < 0 ||
            Util::hexValue(text[i + 2]) < 0) {
            return false;
        }
    }
    return true;
}

Answer refuseMethod(const std::string& reason, const std::string& allowed) {
    Answer answer = Answer::refuse(405, reason);
    answer.headers.emplace_back("Allow", allowed);
    return answer;
}

const char* const HEALTH_PATH = "/health";

bool isRecognitionPath(const std::string& path) {
    return path == RecognitionRequest::WHOLE_PATH || path == RecognitionRequest::STREAMING_PATH;
}

}  // namespace

HttpExchange::HttpExchange(Server& exchangeServer, MHD_Connection* httpConnection, const char* path,
                           const char* method)
    : server(exchangeServer), connection(httpConnection), arrivals(kdGetTimeUST()) {
    head.path = Util::UrlCoder::urlDecodeString(toText(path));
    head.method = toText(method);
    head.uuid = readArgument("uuid");
    head.sessionId = readArgument("sessionId");
    head.soundType = readArgument("Content-Type");
    head.contentType = readHeader("Content-Type");
}

bool HttpExchange::onHead() {
    const Answer answer = judgeHead();
    if (isAnsweredAtEnd) {
        return true;
    }
    if (request) {
        if (server.getOptions().verbose) {
            log(0, "begins");
        }
        return true;
    }
    logRefusal(answer);
    return send(answer);
}

Answer HttpExchange::judgeHead() {
    if (isRecognitionPath(head.path)) {
        return judgeRecognition();
    }
    if (head.path == HEALTH_PATH) {
        isAnsweredAtEnd = head.method == "GET" || head.method == "HEAD";
        return isAnsweredAtEnd ? Answer()
                               : refuseMethod("health is asked for with GET or HEAD", "GET, HEAD");
    }
    if (head.path != "/log") {
        return Answer::refuse(404,
                              "there is nothing here but /asrgw, /asrgw_chunked, /log and /health");
    }
    isAnsweredAtEnd = head.method == "GET";
    return isAnsweredAtEnd ? Answer() : refuseMethod("records come in GET requests", "GET");
}

Answer HttpExchange::judgeRecognition() {
    if (head.method != "POST") {
        return refuseMethod("recognition requests are POST requests", "POST");
    }
    std::string boundary;
    const std::string reason = RecognitionRequest::checkHead(head, boundary);
    if (!reason.empty()) {
        return Answer::refuse(400, reason);
    }
    const std::size_t limit = server.getOptions().maxBodyBytes;
    const std::string length = readHeader("Content-Length");
    if (!length.empty() && std::strtoull(length.c_str(), nullptr, 10) > limit) {
        return Answer::refuse(413, "the body is longer than " + std::to_string(limit) + " bytes");
    }
    beginBody(boundary);
    return Answer();
}

void HttpExchange::beginBody(const std::string& boundary) {
    request = std::make_unique<RecognitionRequest>(head, boundary, server.getPool(),
                                                   server.getOptions().maxBodyBytes);
    pump = std::make_unique<BodyPump>([this](const std::string& piece) {
        if (server.getOptions().verbose) {
            log(0, "sends " + std::to_string(piece.size()) + " bytes");
        }
        request->write(piece.data(), piece.size());
    });
}

bool HttpExchange::onBody(const char* data, std::size_t size) {
    // The rest of a body whose head was refused.
    if (!pump) {
        return true;
    }
    arrivals.add(kdGetTimeUST());
    bodyBytes += size;
    pump->push(data, size);
    return request->takes(bodyBytes);
}

Answer HttpExchange::judgeRecord() const {
    const std::optional<std::string> uuid = readRawArgument("uuid");
    const std::optional<std::string> record = readRawArgument("logmessage");
    if (!uuid || !record) {
        return Answer::refuse(400, uuid ? "there is no logmessage" : "there is no uuid");
    }
    if (!isWellCoded(*uuid) || !isWellCoded(*record)) {
        return Answer::refuse(400, "a % without two hexadecimal digits");
    }
    if (record->empty()) {
        return Answer::refuse(400, "the logmessage is empty");
    }
    const bool kept = server.getRecordLog().append(Util::UrlCoder::urlDecodeString(*uuid),
                                                   Util::UrlCoder::urlDecodeString(*record));
    return kept ? Answer() : Answer::refuse(500, "the record could not be written");
}

Answer HttpExchange::sayReady() const {
    if (server.getOptions().verbose) {
        log(200, "ready");
    }
    Answer answer;
    answer.body = "ready\n";
    return answer;
}

Answer HttpExchange::keepRecord() const {
    Answer answer = judgeRecord();
    if (answer.status != 200) {
        logRefusal(answer);
    } else if (server.getOptions().verbose) {
        log(answer.status, "uuid=" + toLogText(head.uuid));
    }
    return answer;
}

bool HttpExchange::onEnd() {
    if (isAnsweredAtEnd && !answered) {
        return send(head.path == HEALTH_PATH ? sayReady() : keepRecord());
    }
    if (!request || answered) {
        return true;
    }
    const Answer answer = recognise();
    log(answer.status, request->describe(arrivals.describe()));
    return send(answer);
}

Answer HttpExchange::recognise() {
    pump->finish();
    pump.reset();
    Answer answer = request->finish();
    arrivals.answer(kdGetTimeUST());
    if (!readHeader(ARRIVALS_HEADER).empty()) {
        answer.headers.emplace_back(ARRIVALS_HEADER, arrivals.describe());
    }
    return answer;
}

void HttpExchange::onCompleted() {
    pump.reset();
    if (request && !answered) {
        log(0, "went away: " + request->describe(arrivals.describe()));
    }
}

bool HttpExchange::send(const Answer& answer) {
    MHD_Response* response = MHD_create_response_from_buffer(
        answer.body.size(), const_cast<char*>(answer.body.data()), MHD_RESPMEM_MUST_COPY);
    if (response == nullptr) {
        return false;
    }
    answered = true;
    bool sendable =
        MHD_add_response_header(response, "Content-Type", "text/plain; charset=utf-8") == MHD_YES;
    for (const auto& header : answer.headers) {
        sendable = MHD_add_response_header(response, header.first.c_str(), header.second.c_str()) ==
                       MHD_YES &&
                   sendable;
    }
    sendable = sendable && MHD_queue_response(connection, answer.status, response) == MHD_YES;
    MHD_destroy_response(response);
    return sendable;
}

void HttpExchange::logRefusal(const Answer& answer) const {
    log(answer.status, "uuid=" + toLogText(head.uuid) +
                           " refused: " + toLogText(answer.body.substr(0, answer.body.find('\n'))));
}

void HttpExchange::log(unsigned status, const std::string& what) const {
    kdLogFormatMessage("%s %s %s %s", toLogText(head.method).c_str(), toLogText(head.path).c_str(),
                       status == 0 ? "..." : std::to_string(status).c_str(), what.c_str());
}

std::string HttpExchange::readHeader(const char* name) const {
    return toText(MHD_lookup_connection_value(connection, MHD_HEADER_KIND, name));
}

std::string HttpExchange::readArgument(const char* name) const {
    return Util::UrlCoder::urlDecodeString(readRawArgument(name).value_or(""));
}

std::optional<std::string> HttpExchange::readRawArgument(const char* name) const {
    const char* value = MHD_lookup_connection_value(connection, MHD_GET_ARGUMENT_KIND, name);
    return value == nullptr ? std::nullopt : std::optional<std::string>(value);
}

}  // namespace Gateway
