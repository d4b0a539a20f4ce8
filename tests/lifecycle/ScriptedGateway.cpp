#include "ScriptedGateway.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <cstdlib>
#include <limits>
#include <utility>

#include "ScriptedTransport.h"
#include "core/network/NetworkTask.h"
#include "core/util/Base64Coder.h"
#include "pal/kd_time.h"

namespace Lifecycle {

namespace {

const int64_t NS_PER_MS = 1000000;
const int64_t NEVER = std::numeric_limits<int64_t>::max();
const int64_t PAUSE_AFTER_HEAD_NS = 100 * NS_PER_MS;
const std::size_t TOO_MANY_BYTES = std::size_t{2} * 1024 * 1024;

const int STATUS_OK = 200;
const int STATUS_REFUSAL = 404;
const int STATUS_FAILURE = 503;

/** The number in "sessionId=s12" of a URL. */
int readSession(const std::string& url) {
    const std::string key = "&sessionId=s";
    const std::size_t found = url.find(key);
    return found == std::string::npos ? 0 : std::atoi(url.c_str() + found + key.size());
}

int getStatus(Reply reply) {
    switch (reply) {
        case Reply::REFUSAL:
            return STATUS_REFUSAL;
        case Reply::FAILURE:
        case Reply::FAILURE_WITH_WORDS:
            return STATUS_FAILURE;
        default:
            return STATUS_OK;
    }
}

bool hasResults(Reply reply) {
    return reply == Reply::WORDS || reply == Reply::NOTHING_UNDERSTOOD ||
           reply == Reply::FAILURE_WITH_WORDS;
}

std::string makeDocument(Reply reply, int session) {
    if (reply == Reply::NOTHING_UNDERSTOOD) {
        return "<recognitionResults success=\"0\"/>";
    }
    return "<recognitionResults success=\"1\"><variant confidence=\"0.95\">" +
           ScriptedGateway::makeWords(session) + "</variant></recognitionResults>";
}

boost::shared_ptr<Network::HttpResponse> makeHead(Reply reply, int session) {
    auto head = boost::make_shared<Network::HttpResponse>(getStatus(reply));
    std::string header;
    if (hasResults(reply)) {
        header = makeDocument(reply, session);
    } else if (reply == Reply::NOT_XML) {
        header =
            "<recognitionResults success=\"1\"><variant>" + ScriptedGateway::makeWords(session);
    }
    if (!header.empty()) {
        header = Util::Base64Coder::encode({header.begin(), header.end()});
    } else if (reply == Reply::NOT_BASE64) {
        header = "*" + ScriptedGateway::makeWords(session);
    }
    if (!header.empty()) {
        head->addHeader("x-asrgw-recognition-results", header);
    }
    head->addHeader("x-kvrequestid", ScriptedGateway::makeRequestId(session));
    return head;
}

}  // namespace

ScriptedGateway& ScriptedGateway::instance() {
    static auto* const gateway = new ScriptedGateway;
    return *gateway;
}

std::string ScriptedGateway::makeWords(int session) {
    return "words of session " + std::to_string(session);
}

std::string ScriptedGateway::makeRequestId(int session) {
    return "request of session " + std::to_string(session);
}

std::string ScriptedGateway::makeSessionId(int session) {
    return "s" + std::to_string(session);
}

void ScriptedGateway::begin(const std::vector<SessionPlan>& plans, GatewayObserver* watcher) {
    sessions = &plans;
    attempts.assign(plans.size(), 0);
    observer = watcher;
    connections.clear();
}

AttemptPlan ScriptedGateway::takePlan(int session) {
    const auto index = static_cast<std::size_t>(session);
    const std::vector<AttemptPlan>& plans = (*sessions)[index].attempts;
    const std::size_t attempt = attempts[index]++;
    return attempt < plans.size() ? plans[attempt] : AttemptPlan();
}

void ScriptedGateway::connect(Link link) {
    const int session = readSession(link.url);
    Connection connection{std::move(link),  session, takePlan(session), {}, false,
                          Phase::RECEIVING, NEVER};
    connections.push_back(std::move(connection));
}

bool ScriptedGateway::disconnect(const boost::shared_ptr<ScriptedTransfer>& transfer) {
    const std::size_t before = connections.size();
    connections.remove_if(
        [&transfer](const Connection& connection) { return connection.link.transfer == transfer; });
    return connections.size() != before;
}

void ScriptedGateway::end(const boost::shared_ptr<ScriptedTransfer>& transfer, int code) {
    const auto found = std::find_if(
        connections.begin(), connections.end(),
        [&transfer](const Connection& entry) { return entry.link.transfer == transfer; });
    if (found != connections.end()) {
        finish(*found, code);
    }
}

int64_t ScriptedGateway::getNextDue() const {
    int64_t next = NEVER;
    for (const Connection& connection : connections) {
        next = std::min(next, connection.due);
    }
    return next;
}

bool ScriptedGateway::turn() {
    if (answersFirst && serveAny()) {
        return true;
    }
    return (runCommands && runCommands()) || serveAny();
}

bool ScriptedGateway::serveAny() {
    return std::any_of(connections.begin(), connections.end(),
                       [this](Connection& connection) { return serve(connection); });
}

// After `act` the connection may be gone.
bool ScriptedGateway::serve(Connection& connection) {
    if (connection.plan.behaviour == GatewayBehaviour::REFUSE_CONNECTION) {
        finish(connection, Network::NetworkTask::NO_RESPONSE);
        return true;
    }
    if (receive(connection)) {
        return true;
    }
    if (connection.phase != Phase::RECEIVING && kdGetTimeUST() >= connection.due) {
        act(connection);
        return true;
    }
    return false;
}

bool ScriptedGateway::receive(Connection& connection) {
    const AttemptPlan& plan = connection.plan;
    const bool whole = plan.afterBytes == AttemptPlan::WHOLE_BODY;
    if (connection.bodyEnded || (plan.behaviour == GatewayBehaviour::STALL && whole)) {
        return false;
    }
    const std::size_t before = connection.body.size();
    const bool stops = !whole && (plan.behaviour == GatewayBehaviour::STALL ||
                                  plan.behaviour == GatewayBehaviour::RESET);
    const std::size_t most =
        stops ? plan.afterBytes - std::min(plan.afterBytes, before) : AttemptPlan::WHOLE_BODY;
    connection.bodyEnded = connection.link.read(connection.body, most);
    if (connection.bodyEnded) {
        observer->onBody(connection.session, connection.body);
    }
    const bool enough =
        connection.bodyEnded || (!whole && connection.body.size() >= plan.afterBytes);
    const bool acts =
        plan.behaviour != GatewayBehaviour::STALL && plan.behaviour != GatewayBehaviour::SILENCE;
    if (connection.phase == Phase::RECEIVING && enough && acts) {
        connection.phase = Phase::ANSWERING;
        connection.due = kdGetTimeUST() + plan.delayMs * NS_PER_MS;
        return true;
    }
    return connection.bodyEnded || connection.body.size() != before;
}

void ScriptedGateway::act(Connection& connection) {
    if (connection.phase == Phase::HEAD_SENT) {
        sendEnd(connection);
    } else if (connection.plan.behaviour == GatewayBehaviour::RESET) {
        finish(connection, Network::NetworkTask::NO_RESPONSE);
    } else {
        sendHead(connection);
    }
}

void ScriptedGateway::sendHead(Connection& connection) {
    connection.phase = Phase::HEAD_SENT;
    connection.due = kdGetTimeUST() + (connection.plan.pausesAfterHead ? PAUSE_AFTER_HEAD_NS : 0);
    observer->onHead(connection.session, hasResults(connection.plan.reply));
    connection.link.listener->onTransferHead(makeHead(connection.plan.reply, connection.session));
}

void ScriptedGateway::sendEnd(Connection& connection) {
    static const unsigned char TEXT[] = {'o', 'k'};
    // Never read: its size is enough to refuse it.
    static const std::vector<unsigned char> tooMuch(TOO_MANY_BYTES);
    const bool flood = connection.plan.behaviour == GatewayBehaviour::TOO_MUCH;
    const bool taken = connection.link.listener->onTransferBytes(
        flood ? tooMuch.data() : TEXT, flood ? tooMuch.size() : sizeof(TEXT));
    const bool broken = !taken || connection.plan.behaviour == GatewayBehaviour::RESET_AFTER_HEAD;
    finish(connection, broken ? static_cast<int>(Network::NetworkTask::NO_RESPONSE)
                              : getStatus(connection.plan.reply));
}

void ScriptedGateway::finish(const Connection& connection, int code) {
    const boost::shared_ptr<ScriptedTransfer> transfer = connection.link.transfer;
    const int session = connection.session;
    disconnect(transfer);
    observer->onAttemptEnd(session, code);
    transfer->end({code, {}});
}

}  // namespace Lifecycle
