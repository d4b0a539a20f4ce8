#include "Surroundings.h"

#include <cstdio>
#include <filesystem>

#include "Words.h"
#include "cloud/GatewayAnswers.h"

namespace Torture {

namespace {

using TestSupport::Answer;
using TestSupport::ScriptedHttpServer;

Answer answerWords() {
    return CloudTest::answerDocument(CloudTest::makeDocument({{WORDS, "0.95"}}));
}

void copy(char (&target)[TEXT_MAX], const std::string& text) {
    std::snprintf(target, sizeof(target), "%s", text.c_str());
}

void instruct(ScriptedHttpServer& server, Plan::Gateway how) {
    server.setDefaultAnswer(answerWords());
    switch (how) {
        case Plan::Gateway::ANSWERS:
            break;
        case Plan::Gateway::FAILS_ONCE:
            server.script({Answer::status(500)});
            break;
        case Plan::Gateway::REFUSES:
            server.setDefaultAnswer(Answer::status(404));
            break;
        case Plan::Gateway::SILENT:
            server.setDefaultAnswer(Answer::never());
            break;
    }
}

void collect(const ScriptedHttpServer& server, Traffic& traffic) {
    for (std::size_t i = 0; i < server.getRequestCount(); ++i) {
        const ScriptedHttpServer::Request request = server.getRequest(i);
        if (request.complete) {
            const bool isNext = request.head.find(NEXT_UUID) != std::string::npos;
            (isNext ? traffic.next : traffic.first).push_back(request.body);
        }
    }
}

}  // namespace

Surroundings::Surroundings() {
    std::filesystem::create_directory(directory.path("dump"));
    tlsFault = TestSupport::TlsRelay::isAvailable()
                   ? TestSupport::makeCertificate(directory.path("server"), "IP:127.0.0.1")
                   : "openssl and socat are not installed";
}

// What a relay says about its connections is not read, so none serves for long.
void Surroundings::startRelay() {
    const std::string base = directory.path("server");
    relay = std::make_unique<TestSupport::TlsRelay>(base, gateway->getPort());
}

void Surroundings::prepare(const Plan& plan, Order& order) {
    gateway = std::make_unique<ScriptedHttpServer>();
    nextGateway = std::make_unique<ScriptedHttpServer>();
    logServer = std::make_unique<ScriptedHttpServer>();
    instruct(*gateway, plan.gateway);
    instruct(*nextGateway, Plan::Gateway::ANSWERS);
    if (plan.tls) {
        startRelay();
        copy(order.url, relay->getUrl());
        copy(order.nextUrl, relay->getUrl());
        copy(order.certificates, directory.path("server.pem"));
    } else {
        const std::string host = plan.named ? "http://localhost:" : "http://127.0.0.1:";
        copy(order.url, host + std::to_string(gateway->getPort()));
        copy(order.nextUrl, host + std::to_string(nextGateway->getPort()));
    }
    copy(order.logUrl, logServer->getUrl());
    copy(order.directory, directory.path("dump"));
}

Traffic Surroundings::getTraffic() const {
    Traffic traffic;
    collect(*gateway, traffic);
    collect(*nextGateway, traffic);
    return traffic;
}

std::string Surroundings::findObstacle(const Plan& plan) const {
    return plan.tls ? tlsFault : std::string();
}

}  // namespace Torture
