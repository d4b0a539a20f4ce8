#include "gateway/Server.h"

#include <gtest/gtest.h>

#include <future>
#include <thread>

#include "core/util/Base64Coder.h"
#include "gateway/Bodies.h"
#include "gateway/HttpClient.h"
#include "gateway/RecordedSpeech.h"
#include "support/LogCapture.h"

namespace {

using namespace GatewayTest;
using Gateway::Server;
using Gateway::ServerOptions;

constexpr const char* SIMPLE = "/asrgw?uuid=u1&sessionId=s1";
constexpr const char* CHUNKED =
    "/asrgw_chunked?uuid=u1&action=verbose&Content-Type=audio/x-pcm;bit=16;rate=16000";

ServerOptions anyPort() {
    ServerOptions options;
    options.port = 0;
    // A busy machine may take its time.
    options.decoderWaitMs = 60000;
    return options;
}

/** A gateway that runs, with its log kept off the screen. */
class RunningServer {
  public:
    explicit RunningServer(const ServerOptions& options = anyPort()) : server(options) {
        EXPECT_EQ("", server.start());
    }

    TestSupport::LogCapture log;
    Server server;
};

/** The gateway of all tests that need no particular one. */
RunningServer& shared() {
    static RunningServer running;
    return running;
}

const std::string& pcm() {
    static const std::string bytes = toPcm(readRecording("goforward.raw"));
    return bytes;
}

std::string body() {
    return bodyWithSound(pcm(), PCM16K);
}

std::string document(const HttpAnswer& answer) {
    const auto header = answer.headers.find("x-asrgw-recognition-results");
    std::vector<unsigned char> bytes;
    if (header == answer.headers.end() || !Util::Base64Coder::decode(header->second, bytes)) {
        return "none";
    }
    return std::string(bytes.begin(), bytes.end());
}

/** Sends a body whole. */
HttpAnswer post(uint16_t port, const std::string& content, const std::string& target = SIMPLE) {
    HttpClient client(port);
    client.send(requestHead(target, static_cast<long>(content.size())));
    client.send(content);
    return client.read();
}

/** Sends a body in chunks. */
HttpAnswer stream(HttpClient& client, const std::string& content, std::size_t piece) {
    client.send(requestHead(CHUNKED));
    for (std::size_t i = 0; i < content.size(); i += piece) {
        client.sendChunk(content.substr(i, piece));
    }
    client.sendChunk("");
    return client.read();
}

void expectUnderstood(const HttpAnswer& answer) {
    EXPECT_EQ(200, answer.status);
    EXPECT_NE(std::string::npos, document(answer).find("\">go forward ten meters</variant>"))
        << answer.status << ": " << answer.body;
    EXPECT_EQ(1U, answer.headers.count("x-kvrequestid"));
}

}  // namespace

TEST(Server, RecognisesAWholeBody) {
    expectUnderstood(post(shared().server.getPort(), body()));
}

TEST(Server, RecognisesAStreamedBody) {
    HttpClient client(shared().server.getPort());
    const HttpAnswer streamed = stream(client, body(), 3300);
    expectUnderstood(streamed);
}

TEST(Server, ServesSeveralRequestsOnOneConnection) {
    HttpClient client(shared().server.getPort());
    const std::string nothing = parts(usualFields()) + closing();
    const HttpAnswer first = stream(client, nothing, 7);
    const HttpAnswer second = stream(client, nothing, 100);
    EXPECT_EQ(200, first.status);
    EXPECT_EQ(200, second.status);
    EXPECT_NE(first.headers.at("x-kvrequestid"), second.headers.at("x-kvrequestid"));
}

TEST(Server, ServesASlowClientByteByByte) {
    HttpClient client(shared().server.getPort());
    EXPECT_EQ(200, stream(client, parts(usualFields()) + closing(), 1).status);
    HttpClient slowest(shared().server.getPort());
    const std::string content = parts(usualFields()) + closing();
    for (const char byte : requestHead(SIMPLE, static_cast<long>(content.size())) + content) {
        ASSERT_TRUE(slowest.send(std::string(1, byte)));
    }
    EXPECT_EQ(200, slowest.read().status);
}

TEST(Server, ServesSeveralClientsAtOnce) {
    const uint16_t port = shared().server.getPort();
    const std::string expected = document(post(port, body()));
    constexpr int CLIENTS = 4;
    std::vector<std::future<HttpAnswer>> answers;
    answers.reserve(CLIENTS);
    for (int i = 0; i < CLIENTS; ++i) {
        answers.push_back(std::async(std::launch::async, [port] { return post(port, body()); }));
    }
    for (std::future<HttpAnswer>& answer : answers) {
        EXPECT_EQ(expected, document(answer.get()));
    }
}

TEST(Server, GivesBackTheDecoderOfAClientThatVanishes) {
    ServerOptions options = anyPort();
    options.decoders = 1;
    options.verbose = true;
    RunningServer running(options);
    HttpClient vanishing(running.server.getPort());
    vanishing.send(requestHead(CHUNKED));
    const std::string content = body();
    vanishing.sendChunk(content.substr(0, content.size() - 1000));
    // A reset throws away what the gateway has not read. One byte comes in no smaller pieces: when
    // it is told of, all before it has been recognised.
    vanishing.sendChunk(content.substr(content.size() - 1000, 1));
    ASSERT_TRUE(running.log.waitFor("POST /asrgw_chunked ... sends 1 bytes"));
    EXPECT_FALSE(running.server.getPool().tryAcquire());
    vanishing.reset();
    expectUnderstood(post(running.server.getPort(), body()));
    EXPECT_TRUE(running.log.containsPart("went away: uuid=u1"));
}

TEST(Server, GivesUpAClientThatFallsSilent) {
    ServerOptions options = anyPort();
    options.idleSeconds = 1;
    RunningServer running(options);
    HttpClient silent(running.server.getPort());
    silent.send(requestHead(CHUNKED));
    silent.sendChunk(body().substr(0, 50000));
    EXPECT_EQ(0, silent.read().status);
}

TEST(Server, RefusesMalformedRequestsWithAReason) {
    const uint16_t port = shared().server.getPort();
    const HttpAnswer nonsense = post(port, "nonsense");
    EXPECT_EQ(400, nonsense.status);
    EXPECT_EQ(
        "at byte 0 of the body: the body does not begin with the boundary that its content type "
        "names\n",
        nonsense.body);
    EXPECT_EQ("none", document(nonsense));
    EXPECT_EQ(400, post(port, body(), "/asrgw").status);
    EXPECT_EQ("the query names no uuid\n", post(port, body(), "/asrgw?uuid=").body);
    HttpClient untyped(port);
    untyped.send("POST /asrgw?uuid=u1 HTTP/1.1\r\nHost: a\r\nContent-Length: 0\r\n\r\n");
    EXPECT_EQ(400, untyped.read().status);
}

TEST(Server, KnowsItsPathsAndMethods) {
    const uint16_t port = shared().server.getPort();
    EXPECT_EQ(404, post(port, body(), "/other?uuid=u1").status);
    HttpClient client(port);
    client.send(requestHead(SIMPLE, 0, "GET"));
    const HttpAnswer answer = client.read();
    EXPECT_EQ(405, answer.status);
    EXPECT_EQ("POST", answer.headers.at("allow"));
}

TEST(Server, SaysThatItIsReadyOnAConnectionThatStaysAndWithoutALogLine) {
    RunningServer running;
    HttpClient client(running.server.getPort());
    for (int turn = 0; turn < 2; ++turn) {
        client.send("GET /health HTTP/1.1\r\nHost: a\r\n\r\n");
        const HttpAnswer ready = client.read();
        EXPECT_EQ(200, ready.status);
        EXPECT_EQ("ready\n", ready.body);
    }
    EXPECT_EQ(std::vector<std::string>(), running.log.messages());
    HttpClient other(running.server.getPort());
    other.send(requestHead("/health", 0, "PUT"));
    const HttpAnswer refused = other.read();
    EXPECT_EQ(405, refused.status);
    EXPECT_EQ("GET, HEAD", refused.headers.at("allow"));
}

TEST(Server, RefusesBodiesThatAreTooLong) {
    ServerOptions options = anyPort();
    options.maxBodyBytes = 20000;
    RunningServer running(options);
    const uint16_t port = running.server.getPort();
    {
        HttpClient announced(port);
        announced.send(requestHead(SIMPLE, 20001));
        const HttpAnswer answer = announced.read();
        EXPECT_EQ(413, answer.status);
        EXPECT_EQ("the body is longer than 20000 bytes\n", answer.body);
    }
    HttpClient streamed(port);
    EXPECT_EQ(413, stream(streamed, body().substr(0, 30000), 1000).status);
    HttpClient endless(port);
    EXPECT_EQ(0, stream(endless, body(), 1000).status);
    EXPECT_EQ(200, post(port, parts(usualFields()) + closing()).status);
}

TEST(Server, HonoursCancellation) {
    const uint16_t port = shared().server.getPort();
    HttpClient client(port);
    const HttpAnswer canceled =
        stream(client,
               parts(usualFields()) + part("audio", pcm().substr(0, 40000), PCM16K) +
                   part("canceled", "true") + closing(),
               3200);
    EXPECT_EQ(200, canceled.status);
    EXPECT_EQ("none", document(canceled));
}

TEST(Server, RefusesALanguageThatItHasNoModelFor) {
    RunningServer running;
    const uint16_t port = running.server.getPort();
    const std::string reason = "the language ru-RU is not available; this gateway recognises en";
    const std::string content = bodyWithSound(pcm(), PCM16K, "ru-RU");
    HttpClient client(port);
    for (const HttpAnswer& answer : {post(port, content), stream(client, content, 3200)}) {
        EXPECT_EQ(400, answer.status);
        EXPECT_EQ(reason + "\n", answer.body);
        EXPECT_EQ("text/plain; charset=utf-8", answer.headers.at("content-type"));
        EXPECT_EQ("none", document(answer));
    }
    EXPECT_EQ(400, post(port, bodyWithSound(pcm(), PCM16K, "")).status);
    running.server.stop();
    const std::vector<std::string> lines = running.log.messages();
    ASSERT_EQ(3U, lines.size());
    for (const std::size_t i : {0U, 1U}) {
        EXPECT_NE(std::string::npos, lines[i].find(" 400 uuid=u1 "));
        EXPECT_NE(std::string::npos, lines[i].find(" refused: \"" + reason + "\"")) << lines[i];
    }
    EXPECT_NE(std::string::npos, lines[2].find("the field lang is empty")) << lines[2];
}

TEST(Server, RefusesForAWhileWhenAllDecodersAreBusy) {
    ServerOptions options = anyPort();
    options.decoders = 2;
    options.decoderWaitMs = 0;
    RunningServer running(options);
    const uint16_t port = running.server.getPort();
    Gateway::DecoderPool::Lease first = running.server.getPool().tryAcquire();
    const Gateway::DecoderPool::Lease second = running.server.getPool().tryAcquire();
    ASSERT_TRUE(first && second);
    HttpClient client(port);
    for (const HttpAnswer& answer : {post(port, body()), stream(client, body(), 3200)}) {
        EXPECT_EQ(503, answer.status);
        EXPECT_EQ("2", answer.headers.at("retry-after"));
        EXPECT_EQ("all decoders are busy\n", answer.body);
    }
    first.reset();
    expectUnderstood(stream(client, body(), 3200));
}

TEST(Server, ServesARequestThatWaitsForADecoder) {
    ServerOptions options = anyPort();
    options.decoders = 1;
    RunningServer running(options);
    const uint16_t port = running.server.getPort();
    Gateway::DecoderPool& pool = running.server.getPool();
    Gateway::DecoderPool::Lease busy = pool.tryAcquire();
    std::future<HttpAnswer> answer =
        std::async(std::launch::async, [port] { return post(port, body()); });
    while (pool.getWaiting() == 0) {
        std::this_thread::yield();
    }
    busy.reset();
    expectUnderstood(answer.get());
}

TEST(Server, LosesNoSoundThatArrivesWhileAllDecodersAreBusy) {
    ServerOptions options = anyPort();
    options.decoders = 1;
    options.decoderWaitMs = 0;
    options.verbose = true;
    RunningServer running(options);
    HttpClient unhindered(running.server.getPort());
    const std::string expected = document(stream(unhindered, body(), 3200));
    Gateway::DecoderPool::Lease busy = running.server.getPool().tryAcquire();
    ASSERT_TRUE(busy);
    HttpClient client(running.server.getPort());
    const std::string content = body();
    client.send(requestHead(CHUNKED));
    client.sendChunk(content.substr(0, content.size() - 1001));
    client.sendChunk(content.substr(content.size() - 1001, 1));
    ASSERT_TRUE(running.log.waitFor("POST /asrgw_chunked ... sends 1 bytes"));
    busy.reset();
    client.sendChunk(content.substr(content.size() - 1000));
    client.sendChunk("");
    EXPECT_EQ(expected, document(client.read()));
}

TEST(Server, LogsOneLinePerRequest) {
    RunningServer running;
    EXPECT_EQ(200, post(running.server.getPort(), parts(usualFields("en")) + closing()).status);
    EXPECT_EQ(404, post(running.server.getPort(), "", "/evil%0aline").status);
    running.server.stop();
    const std::vector<std::string> lines = running.log.messages();
    ASSERT_EQ(2U, lines.size());
    EXPECT_EQ(0U, lines[0].find("POST /asrgw 200 uuid=u1 session=s1 lang=en topic=freeform type=- "
                                "bytes="))
        << lines[0];
    EXPECT_EQ(0U, lines[1].find("POST /evil\\x0aline 404 uuid=- refused: ")) << lines[1];
}

TEST(Server, StopsWhileClientsAreConnected) {
    ServerOptions options = anyPort();
    RunningServer running(options);
    HttpClient idle(running.server.getPort());
    HttpClient streaming(running.server.getPort());
    streaming.send(requestHead(CHUNKED));
    streaming.sendChunk(body().substr(0, 80000));
    running.server.stop();
    EXPECT_EQ(0, idle.read().status);
    EXPECT_EQ(0, streaming.read().status);
}

TEST(Server, SaysWhyItCannotStart) {
    ServerOptions taken = anyPort();
    taken.port = shared().server.getPort();
    Server second(taken);
    EXPECT_EQ(0U, second.start().find("cannot listen on 127.0.0.1 port "));
    ServerOptions unknown = anyPort();
    unknown.host = "256.0.0.1";
    Server nowhere(unknown);
    EXPECT_EQ(0U, nowhere.start().find("the address 256.0.0.1 is not known"));
    ServerOptions speechless = anyPort();
    speechless.model.dictionary = "/nowhere";
    Server without(speechless);
    EXPECT_EQ("cannot read the model's file /nowhere", without.start());
}

TEST(Server, NamesAnAddressThatClientsCanUse) {
    EXPECT_EQ("http://127.0.0.1:" + std::to_string(shared().server.getPort()),
              shared().server.getUrl());
    ServerOptions options = anyPort();
    options.host = "::1";
    EXPECT_EQ("http://[::1]:0", Server(options).getUrl());
    options.host = "0.0.0.0";
    EXPECT_EQ("http://127.0.0.1:0", Server(options).getUrl());
}
