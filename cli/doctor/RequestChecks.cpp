#include "RequestChecks.h"

#include "AnswerCheck.h"
#include "ArrivalReport.h"
#include "ProbeText.h"
#include "cli/Text.h"

namespace Cli {

namespace {

/** A body that arrives within less than this share of the time it took to send was collected. */
const double SPREAD_MIN = 0.5;
/** Limits are looked for in steps of 32 KiB. */
const std::size_t SIZE_STEP = 32768;

const int NOT_FOUND_STATUS = 404;
const int NO_METHOD_STATUS = 405;
const int TOO_LARGE_STATUS = 413;

const char* const COLLECTED =
    "something between here and the gateway collects the request before it passes it on";
const char* const COLLECTED_ADVICE =
    "with nginx set proxy_request_buffering off and proxy_http_version 1.1";

std::optional<Check> findPathFault(const ProbeResult& result, const std::string& path,
                                   int timeoutMs) {
    if (std::optional<Check> none = findNoAnswer("path", result, timeoutMs)) {
        return none;
    }
    if (result.status >= 300 && result.status < 400) {
        const auto location = result.headers.find("location");
        const std::string place =
            location == result.headers.end() ? "another address" : printable(location->second);
        return Check("path", Check::PROBLEM,
                     path + " redirects to " + place + " (status " + std::to_string(result.status) +
                         "); no session follows that",
                     "give the application the address that it redirects to");
    }
    if (result.status == NOT_FOUND_STATUS || result.status == NO_METHOD_STATUS) {
        return Check("path", Check::PROBLEM, path + " is not served here: " + statusText(result),
                     "check the address, and that the front passes /asrgw and /asrgw_chunked on "
                     "without a change");
    }
    return std::nullopt;
}

void addAnswer(Check& check, const ProbeResult& result) {
    check.ms = result.answerMs;
    check.figures.emplace_back("status", result.status);
    check.figures.emplace_back("answerMs", result.answerMs);
}

/** What the gateway knows of the way, for the end of a finding. */
std::string ownTime(const std::optional<ArrivalReport>& report) {
    return report ? ", " + msText(report->answerMs) + " of it in the gateway" : "";
}

std::optional<ArrivalReport> readReport(const ProbeResult& result) {
    const auto header = result.headers.find(ARRIVALS_HEADER);
    return header == result.headers.end() ? std::nullopt : ArrivalReport::read(header->second);
}

bool isCollected(const ProbeResult& result, const ArrivalReport& report) {
    return report.lastMs - report.firstMs < SPREAD_MIN * result.streamedMs;
}

void addArrivals(Check& check, const ProbeResult& result, const ArrivalReport& report) {
    check.figures.emplace_back("sentMs", result.streamedMs);
    check.figures.emplace_back("pieces", report.pieces);
    check.figures.emplace_back("firstMs", report.firstMs);
    check.figures.emplace_back("lastMs", report.lastMs);
    check.figures.emplace_back("gapMs", report.gapMs);
    check.figures.emplace_back("gatewayAnswerMs", report.answerMs);
}

Check judgeArrivals(const ProbeResult& result) {
    const std::optional<ArrivalReport> report = readReport(result);
    const std::string status =
        "status 200, answer " + msText(result.answerMs) + " after the last piece";
    if (!report) {
        return {"streamed", Check::UNKNOWN,
                status +
                    "; the gateway does not report when the pieces arrived, so whether "
                    "something collects them on the way is not known",
                "compare with the gateway's own log, or try talvox-gateway behind the same front"};
    }
    const std::string arrival = "sent in " + msText(result.streamedMs) + ", arrived in " +
                                msText(report->lastMs - report->firstMs) + " (" +
                                fixed(report->pieces, 0, 0) + " pieces, longest pause " +
                                msText(report->gapMs) + ")";
    if (isCollected(result, *report)) {
        return {"streamed", Check::PROBLEM, std::string(COLLECTED) + ": " + arrival,
                COLLECTED_ADVICE};
    }
    return {"streamed", Check::WELL, status + ownTime(report) + "; " + arrival};
}

Check checkStreamedOnce(const ProbeTarget& target, const ProbeRequests& requests) {
    HttpProbe probe(target);
    const ProbeResult result = probe.send(requests.makeStreamed());
    if (const std::optional<Check> fault = findFault("streamed", result, target.timeoutMs)) {
        return *fault;
    }
    if (result.isCutShort) {
        return {"streamed", Check::PROBLEM,
                "status " + std::to_string(result.status) + " before the last piece was sent"};
    }
    Check check = judgeArrivals(result);
    addAnswer(check, result);
    if (const std::optional<ArrivalReport> report = readReport(result)) {
        addArrivals(check, result, *report);
    }
    return check;
}

ProbeResult sendOfSize(const ProbeTarget& target, const ProbeRequests& requests,
                       std::size_t bytes) {
    HttpProbe probe(target);
    return probe.send(requests.makeOfSize(bytes));
}

/** The longest body that passes, in steps, between one that does and one that does not. */
std::size_t findLimit(const ProbeTarget& target, const ProbeRequests& requests,
                      std::size_t failing) {
    std::size_t low = 0;
    std::size_t high = failing / SIZE_STEP + 1;
    while (high - low > 1) {
        const std::size_t middle = (low + high) / 2;
        const ProbeResult result = sendOfSize(target, requests, middle * SIZE_STEP);
        (result.status >= 200 && result.status < 300 ? low : high) = middle;
    }
    return low * SIZE_STEP;
}

}  // namespace

Check checkPath(const ProbeTarget& target, const ProbeRequests& requests) {
    Check check("path", Check::WELL, "/asrgw and /asrgw_chunked answer");
    double ms = 0;
    for (const bool isStreamed : {false, true}) {
        HttpProbe probe(target);
        const ProbeResult result = probe.send(requests.makeEmpty(isStreamed));
        const std::string path = isStreamed ? "/asrgw_chunked" : "/asrgw";
        if (const std::optional<Check> fault = findPathFault(result, path, target.timeoutMs)) {
            return *fault;
        }
        const auto server = result.headers.find("server");
        if (server != result.headers.end() && !isStreamed) {
            check.finding += "; the server calls itself " + printable(server->second);
        }
        ms += result.answerMs;
    }
    check.ms = ms;
    return check;
}

Check checkWhole(const ProbeTarget& target, const ProbeRequests& requests) {
    HttpProbe probe(target);
    const ProbeResult result = probe.send(requests.makeWhole());
    if (const std::optional<Check> fault = findFault("whole", result, target.timeoutMs)) {
        return *fault;
    }
    Check check("whole", Check::WELL,
                "status 200, answer " + msText(result.answerMs) + " after the body" +
                    ownTime(readReport(result)));
    addAnswer(check, result);
    return check;
}

Check checkStreamed(const ProbeTarget& target, const ProbeRequests& requests) {
    const Check first = checkStreamedOnce(target, requests);
    // A gateway that got no processor for a second reads everything at once as well.
    return first.finding.find(COLLECTED) == 0 ? checkStreamedOnce(target, requests) : first;
}

Check checkSize(const ProbeTarget& target, const ProbeRequests& requests) {
    const std::size_t bytes = requests.getMaxSize();
    const std::string size = megabytesText(bytes);
    const ProbeResult result = sendOfSize(target, requests, bytes);
    if (result.status != TOO_LARGE_STATUS) {
        if (const std::optional<Check> fault = findFault("size", result, target.timeoutMs)) {
            return {"size", Check::PROBLEM, "a body of " + size + ": " + fault->finding,
                    fault->advice};
        }
        Check check("size", Check::WELL, "a body of " + size + ", the longest session's, passes");
        check.ms = result.answerMs;
        return check;
    }
    const std::size_t limit = findLimit(target, requests, bytes);
    Check check("size", Check::PROBLEM,
                "limit of " + megabytesText(limit) + " for a body: " + statusText(result) +
                    " for one of " + size + ", which 20 s of sound at 44.1 kHz take",
                "with nginx set client_max_body_size 2m, with talvox-gateway raise --max-body");
    check.figures.emplace_back("limitBytes", static_cast<double>(limit));
    return check;
}

Check checkKept(const ProbeTarget& target, const ProbeRequests& requests, int idleMs) {
    if (idleMs == 0) {
        return {"kept", Check::SKIPPED, "not watched"};
    }
    HttpProbe probe(target);
    const ProbeResult result = probe.send(requests.makeEmpty(false));
    if (const std::optional<Check> none = findNoAnswer("kept", result, target.timeoutMs)) {
        return *none;
    }
    const std::optional<double> closedMs = probe.waitForClose(idleMs);
    if (!closedMs) {
        return {"kept", Check::WELL,
                "a kept connection is still open after " + secondsText(idleMs)};
    }
    Check check("kept", Check::PROBLEM,
                *closedMs < 500 ? "connections are closed after each answer"
                                : "kept connections are closed after " + secondsText(*closedMs),
                "sessions that come later have to connect first: raise the time for which the "
                "server keeps idle connections");
    check.figures.emplace_back("closedMs", *closedMs);
    return check;
}

}  // namespace Cli
