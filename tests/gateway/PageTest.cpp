// The page of the last sessions, as bytes on a connection.
#include "gateway/Page.h"

#include <gtest/gtest.h>
#include <netinet/in.h>

#include <nlohmann/json.hpp>

#include "gateway/Bodies.h"
#include "gateway/HttpClient.h"
#include "gateway/Loopback.h"
#include "gateway/RecordedSpeech.h"
#include "gateway/Server.h"
#include "support/LogCapture.h"

namespace {

using namespace GatewayTest;
using Gateway::Server;
using Gateway::ServerOptions;
using Json = nlohmann::json;

class PageTest : public ::testing::Test {
  protected:
    static ServerOptions options(bool hasPage) {
        ServerOptions options;
        options.port = 0;
        options.decoderWaitMs = 60000;
        options.hasPage = hasPage;
        options.recordFile = "/dev/null";
        options.verbose = true;
        return options;
    }

    void SetUp() override { ASSERT_EQ("", server.start()); }

    HttpAnswer get(const std::string& target, const std::string& host = "localhost:8090",
                   const std::string& method = "GET") {
        HttpClient client(server.getPort());
        client.send(method + " " + target + " HTTP/1.1\r\n" +
                    (host.empty() ? std::string() : "Host: " + host + "\r\n") + "\r\n");
        return client.read();
    }

    Json changes() { return Json::parse(get("/page/changes").body); }

    TestSupport::LogCapture log;
    Server server{options(true)};
};

TEST_F(PageTest, IsThereOnlyWhenAskedFor) {
    EXPECT_EQ(200, get("/").status);
    Server without(options(false));
    ASSERT_EQ("", without.start());
    HttpClient client(without.getPort());
    client.send("GET / HTTP/1.1\r\nHost: localhost\r\n\r\n");
    const HttpAnswer answer = client.read();
    EXPECT_EQ(404, answer.status);
    EXPECT_EQ(
        "there is nothing here but /asrgw, /asrgw_chunked, /log and /health; a page needs --page\n",
        answer.body);
    HttpClient other(without.getPort());
    other.send("GET /page/changes HTTP/1.1\r\nHost: localhost\r\n\r\n");
    EXPECT_EQ(404, other.read().status);
}

TEST_F(PageTest, AllowsNothingButItsOwnParts) {
    for (const auto& [target, type] : {std::pair("/", "text/html; charset=utf-8"),
                                       std::pair("/page/page.css", "text/css; charset=utf-8"),
                                       std::pair("/page/page.js", "text/javascript; charset=utf-8"),
                                       std::pair("/page/changes", "application/json"),
                                       std::pair("/page/none", "text/plain; charset=utf-8")}) {
        HttpAnswer answer = get(target);
        EXPECT_EQ(std::string(target) == "/page/none" ? 404 : 200, answer.status) << target;
        EXPECT_EQ(type, answer.headers["content-type"]);
        EXPECT_EQ(
            "default-src 'none'; script-src 'self'; style-src 'self'; connect-src 'self'; "
            "media-src blob:; img-src data:; base-uri 'none'; form-action 'none'; "
            "frame-ancestors 'none'; require-trusted-types-for 'script'; trusted-types 'none'",
            answer.headers["content-security-policy"]);
        EXPECT_EQ("nosniff", answer.headers["x-content-type-options"]);
        EXPECT_EQ("same-origin", answer.headers["cross-origin-resource-policy"]);
        EXPECT_EQ("no-store", answer.headers["cache-control"]);
        EXPECT_EQ(0U, answer.headers.count("access-control-allow-origin"));
    }
}

TEST_F(PageTest, AnswersOnlyToALoopbackName) {
    for (const char* host :
         {"localhost", "LOCALHOST:1", "127.0.0.1:8090", "127.9.8.7", "[::1]", "[::1]:8090"}) {
        EXPECT_EQ(200, get("/page/changes", host).status) << host;
    }
    for (const char* host : {"example.org", "127.0.0.1.example.org", "127.evil", "localhost.evil",
                             "10.0.0.1", "[::2]", "[::1", "0.0.0.0", ""}) {
        for (const char* target : {"/", "/page/changes", "/page/sound?id=1", "/page/page.js"}) {
            const HttpAnswer answer = get(target, host);
            EXPECT_GE(answer.status, 400) << host;
            EXPECT_EQ(std::string::npos, answer.body.find("instance")) << answer.body;
        }
    }
    EXPECT_EQ("the page is for this machine: call it by a loopback address\n",
              get("/", "example.org").body);
}

TEST_F(PageTest, NeedsALoopbackAddress) {
    ServerOptions open = options(true);
    open.host = "0.0.0.0";
    Server refused(open);
    EXPECT_EQ(
        "the page shows what all clients say, so it needs a loopback address; 0.0.0.0 is none",
        refused.start());
    EXPECT_EQ(0, refused.getPort());
    open.hasPage = false;
    Server without(open);
    EXPECT_EQ("", without.start());
    EXPECT_FALSE(without.isOnLoopback());
}

TEST_F(PageTest, KnowsLoopbackAddresses) {
    sockaddr_in v4{};
    v4.sin_family = AF_INET;
    v4.sin_addr.s_addr = htonl(0x7f000102);
    EXPECT_TRUE(Gateway::isLoopback(reinterpret_cast<const sockaddr&>(v4)));
    v4.sin_addr.s_addr = htonl(0x0a00007f);
    EXPECT_FALSE(Gateway::isLoopback(reinterpret_cast<const sockaddr&>(v4)));
    sockaddr_in6 v6{};
    v6.sin6_family = AF_INET6;
    EXPECT_FALSE(Gateway::isLoopback(reinterpret_cast<const sockaddr&>(v6)));
    v6.sin6_addr = in6addr_loopback;
    EXPECT_TRUE(Gateway::isLoopback(reinterpret_cast<const sockaddr&>(v6)));
}

TEST_F(PageTest, IsReadOnAConnectionThatStaysAndWithoutALogLine) {
    HttpClient client(server.getPort());
    for (int turn = 0; turn < 3; ++turn) {
        client.send("GET /page/changes HTTP/1.1\r\nHost: localhost\r\n\r\n");
        EXPECT_EQ(200, client.read().status);
    }
    EXPECT_EQ(std::vector<std::string>(), log.messages());
    const HttpAnswer refused = get("/", "localhost", "DELETE");
    EXPECT_EQ(405, refused.status);
    EXPECT_EQ("GET, HEAD", refused.headers.at("allow"));
}

TEST_F(PageTest, ShowsWhatARequestBrought) {
    const std::string pcm = toPcm(readRecording("goforward.raw"));
    HttpClient client(server.getPort());
    client.send(requestHead("/asrgw_chunked?uuid=u1&sessionId=ride-7"));
    client.sendChunk(bodyWithSound(pcm, PCM16K));
    client.sendChunk("");
    ASSERT_EQ(200, client.read().status);
    const Json session = changes()["sessions"][0];
    EXPECT_EQ("ride-7", session["sessionId"]);
    EXPECT_EQ("en-US", session["language"]);
    EXPECT_EQ("freeform", session["topic"]);
    EXPECT_EQ(PCM16K, session["soundType"]);
    EXPECT_EQ(200, session["status"]);
    EXPECT_EQ(false, session["isRunning"]);
    EXPECT_EQ(pcm.size(), session["soundBytes"]);
    EXPECT_EQ("go forward ten meters", session["hypotheses"][0]["text"]);
    EXPECT_GT(session["hypotheses"][0]["confidence"], 0);
    EXPECT_GT(session["answerMs"], 0);
    std::size_t bytes = 0;
    for (const Json& piece : session["pieces"]) {
        bytes += piece[1].get<std::size_t>();
    }
    EXPECT_EQ(bytes, session["bodyBytes"]);
    const HttpAnswer sound = get("/page/sound?id=1");
    EXPECT_EQ("audio/wav", sound.headers.at("content-type"));
    EXPECT_EQ(pcm, sound.body.substr(44));
    EXPECT_EQ(404, get("/page/sound?id=2").status);
    EXPECT_EQ(404, get("/page/sound?id=nonsense").status);
}

TEST_F(PageTest, ShowsRequestsThatFail) {
    HttpClient nonsense(server.getPort());
    nonsense.send(requestHead("/asrgw?uuid=u1", 8));
    nonsense.send("nonsense");
    EXPECT_EQ(400, nonsense.read().status);
    HttpClient nameless(server.getPort());
    nameless.send(requestHead("/asrgw", 0));
    EXPECT_EQ(400, nameless.read().status);
    {
        HttpClient vanishing(server.getPort());
        vanishing.send(requestHead("/asrgw?uuid=u3", 1000));
        vanishing.send("--");
        // A reset throws away what the gateway has not read.
        ASSERT_TRUE(log.waitFor("POST /asrgw ... sends 2 bytes"));
        vanishing.reset();
        ASSERT_TRUE(log.waitForPart("went away: uuid=u3"));
    }
    const Json sessions = changes()["sessions"];
    ASSERT_EQ(3U, sessions.size());
    EXPECT_EQ(400, sessions[0]["status"]);
    EXPECT_EQ(
        "at byte 0 of the body: the body does not begin with the boundary that its content type "
        "names",
        sessions[0]["refusal"]);
    EXPECT_EQ("the query names no uuid", sessions[1]["refusal"]);
    EXPECT_EQ(false, sessions[1]["isRunning"]);
    EXPECT_EQ(0, sessions[2]["status"]);
    EXPECT_EQ(false, sessions[2]["isRunning"]);
}

TEST_F(PageTest, ShowsUsageRecords) {
    EXPECT_EQ(200, get("/log?uuid=u1&logmessage=started%3b%3cb%3e").status);
    EXPECT_EQ(400, get("/log?uuid=u2&logmessage=").status);
    const Json records = changes()["records"];
    ASSERT_EQ(2U, records.size());
    EXPECT_EQ("u1", records[0]["uuid"]);
    EXPECT_EQ("started;<b>", records[0]["text"]);
    EXPECT_EQ(200, records[0]["status"]);
    EXPECT_EQ(400, records[1]["status"]);
}

}  // namespace
