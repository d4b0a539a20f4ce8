#include "gateway/HttpExchange.h"

#include <microhttpd.h>

#include <cstdlib>

#include "core/util/Ascii.h"
#include "core/util/UrlCoder.h"
#include "gateway/LogText.h"
#include "gateway/Page.h"
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

bool isReading(const std::string& method) {
    return method == "GET" || method == "HEAD";
}

Answer refuseMethod(const std::string& reason, const std::string& allowed) {
    Answer answer = Answer::refuse(405, reason);
    answer.headers.emplace_back("Allow", allowed);
    return answer;
}

const char* const HEALTH_PATH = "/health";
const char* const LOG_PATH = "/log";

bool isRecognitionPath(const std::string& path) {
    return path == RecognitionRequest::WHOLE_PATH || path == RecognitionRequest::STREAMING_PATH;
}

}  // namespace

HttpExchange::HttpExchange(Server& exchangeServer, MHD_Connection* httpConnection, const char* path,
                           const char* method)
    : server(exchangeServer),
      connection(httpConnection),
      sessions(exchangeServer.getSessions()),
      arrivals(kdGetTimeUST()) {
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
        isAnsweredAtEnd = isReading(head.method);
        return isAnsweredAtEnd ? Answer()
                               : refuseMethod("health is asked for with GET or HEAD", "GET, HEAD");
    }
    if (sessions != nullptr && Page::owns(head.path)) {
        isAnsweredAtEnd = isReading(head.method);
        return isAnsweredAtEnd ? Answer()
                               : refuseMethod("the page is read with GET or HEAD", "GET, HEAD");
    }
    if (head.path != LOG_PATH) {
        const std::string hint = head.path == "/" ? "; a page needs --page" : "";
        return Answer::refuse(
            404, "there is nothing here but /asrgw, /asrgw_chunked, /log and /health" + hint);
    }
    isAnsweredAtEnd = head.method == "GET";
    return isAnsweredAtEnd ? Answer() : refuseMethod("records come in GET requests", "GET");
}

Answer HttpExchange::judgeRecognition() {
    Answer answer = judgeRecognitionHead();
    if (sessions != nullptr && answer.status != 200) {
        RequestSummary summary;
        summary.refusal = answer.body.substr(0, answer.body.find('\n'));
        sessions->end(sessions->begin(head), answer.status, summary, 0);
    }
    return answer;
}

Answer HttpExchange::judgeRecognitionHead() {
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
    if (sessions != nullptr) {
        session = sessions->begin(head);
        request->setSoundSink(
            [this](const std::vector<int16_t>& samples) { sessions->addSound(session, samples); });
    }
    pump = std::make_unique<BodyPump>([this](const std::string& piece) { writeBody(piece); });
}

void HttpExchange::writeBody(const std::string& piece) {
    if (server.getOptions().verbose) {
        log(0, "sends " + std::to_string(piece.size()) + " bytes");
    }
    request->write(piece.data(), piece.size());
    if (sessions != nullptr) {
        sessions->update(session, request->summarise());
    }
}

bool HttpExchange::onBody(const char* data, std::size_t size) {
    // The rest of a body whose head was refused.
    if (!pump) {
        return true;
    }
    const KDust now = kdGetTimeUST();
    arrivals.add(now);
    bodyBytes += size;
    if (sessions != nullptr) {
        sessions->addPiece(session, arrivals.sinceHead(now), size);
    }
    pump->push(data, size);
    return request->takes(bodyBytes);
}

Answer HttpExchange::judgeRecord(const std::optional<std::string>& uuid,
                                 const std::optional<std::string>& record) const {
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

Answer HttpExchange::answerPage() const {
    return Page::answer(*sessions, {head.path, readHeader("Host"), readArgument("instance"),
                                    readArgument("after"), readArgument("id")});
}

Answer HttpExchange::answerAtEnd() const {
    if (head.path == HEALTH_PATH) {
        return sayReady();
    }
    return head.path == LOG_PATH ? keepRecord() : answerPage();
}

Answer HttpExchange::keepRecord() const {
    const std::optional<std::string> record = readRawArgument("logmessage");
    Answer answer = judgeRecord(readRawArgument("uuid"), record);
    if (sessions != nullptr) {
        sessions->addRecord(head.uuid, Util::UrlCoder::urlDecodeString(record.value_or("")),
                            answer.status);
    }
    if (answer.status != 200) {
        logRefusal(answer);
    } else if (server.getOptions().verbose) {
        log(answer.status, "uuid=" + toLogText(head.uuid));
    }
    return answer;
}

bool HttpExchange::onEnd() {
    if (isAnsweredAtEnd && !answered) {
        return send(answerAtEnd());
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
    if (sessions != nullptr) {
        sessions->end(session, answer.status, request->summarise(), arrivals.getAnswerTime());
    }
    if (!readHeader(ARRIVALS_HEADER).empty()) {
        answer.headers.emplace_back(ARRIVALS_HEADER, arrivals.describe());
    }
    return answer;
}

void HttpExchange::onCompleted() {
    pump.reset();
    if (request && !answered) {
        if (sessions != nullptr) {
            sessions->end(session, 0, request->summarise(), 0);
        }
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
        MHD_add_response_header(response, "Content-Type", answer.contentType.c_str()) == MHD_YES;
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
