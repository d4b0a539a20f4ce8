#include "AnswerCheck.h"

#include "ProbeText.h"
#include "cli/Text.h"

namespace Cli {

const char* const RESULTS_HEADER = "x-asrgw-recognition-results";
const char* const ARRIVALS_HEADER = "x-asrgw-arrivals";

namespace {

const int TOO_LARGE_STATUS = 413;
const int BUSY_STATUS = 503;
const int BAD_GATEWAY_STATUS = 502;
const int GATEWAY_TIMEOUT_STATUS = 504;

std::string adviseOn(int status) {
    switch (status) {
        case TOO_LARGE_STATUS:
            return "raise the limit for a body: client_max_body_size in nginx, --max-body in "
                   "talvox-gateway";
        case BAD_GATEWAY_STATUS:
        case GATEWAY_TIMEOUT_STATUS:
            return "a front does not reach the gateway behind it: check that it runs";
        case BUSY_STATUS:
            return "the gateway is busy, or the front has no gateway that is up";
        default:
            return "";
    }
}

}  // namespace

std::string statusText(const ProbeResult& result) {
    std::string text = "status " + std::to_string(result.status);
    const auto type = result.headers.find("content-type");
    const bool isText = type != result.headers.end() && type->second.find("text/plain") == 0;
    const std::string line = isText ? firstLine(result.body) : "";
    return line.empty() ? text : text + " (" + line + ")";
}

std::optional<Check> findNoAnswer(const std::string& name, const ProbeResult& result,
                                  int timeoutMs) {
    if (result.isTimeout) {
        return Check(
            name, Check::PROBLEM,
            result.isConnected
                ? "the request was sent, but nothing answered within " + secondsText(timeoutMs)
                : "no connection within " + secondsText(timeoutMs),
            "check the gateway's log for the request; if it is not there, check the front");
    }
    if (result.status == 0) {
        return Check(name, Check::PROBLEM,
                     "the connection ended without an answer: " + printable(result.error),
                     "check the logs of the gateway and of the front");
    }
    return std::nullopt;
}

std::optional<Check> findFault(const std::string& name, const ProbeResult& result, int timeoutMs) {
    if (std::optional<Check> none = findNoAnswer(name, result, timeoutMs)) {
        return none;
    }
    if (result.status < 200 || result.status > 299) {
        return Check(name, Check::PROBLEM, statusText(result), adviseOn(result.status));
    }
    if (result.headers.count(RESULTS_HEADER) == 0) {
        return Check(name, Check::PROBLEM,
                     statusText(result) + " without " + RESULTS_HEADER +
                         ": what answers is no recognition gateway, or the header was removed",
                     "check the address, and that the front passes the gateway's headers on");
    }
    return std::nullopt;
}

}  // namespace Cli
