// What "talvox doctor" finds on the way to servers that do as a test tells them.
#include <gmock/gmock.h>

#include "DoctorRun.h"
#include "RecognizeRun.h"
#include "ToolProcess.h"
#include "support/ScratchDirectory.h"
#include "support/ScriptedHttpServer.h"
#include "support/TlsRelay.h"
#include "support/TlsServer.h"

namespace {

using ::testing::HasSubstr;
using ::testing::MatchesRegex;
using ::testing::StartsWith;
using TestSupport::Answer;
using TestSupport::DoctorResult;
using TestSupport::makeCertificate;
using TestSupport::makeSignedCertificate;
using TestSupport::RefusingPort;
using TestSupport::resultAnswer;
using TestSupport::runDoctor;
using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;
using TestSupport::ScriptedHttpServer;
using TestSupport::TlsRelay;
using TestSupport::ToolResult;

const char* const ALL = "name connection tls path whole streamed size kept";
const std::vector<std::string> QUICKLY = {"--idle", "0", "--timeout", "20"};

const char* const UNDERSTOOD = "<variant confidence=\"1\">a</variant>";

TEST(ToolDoctor, SaysThatANameIsNotKnown) {
    // No name server is asked for a label of 64 characters.
    const std::string name(64, 'a');
    const DoctorResult result = runDoctor("http://" + name + ":80", QUICKLY);
    EXPECT_EQ(1, result.status);
    EXPECT_EQ("name", result.names());
    EXPECT_EQ("problem", result.verdict("name"));
    EXPECT_THAT(result.words("name"), StartsWith("the name " + name + " is not known here\ncheck"));
    EXPECT_EQ(false, result.report()["well"]);
}

TEST(ToolDoctor, SaysThatAConnectionIsRefused) {
    const RefusingPort port;
    const DoctorResult result = runDoctor(port.getUrl(), QUICKLY);
    EXPECT_EQ(1, result.status);
    EXPECT_EQ("name connection", result.names());
    EXPECT_EQ("well", result.verdict("name"));
    EXPECT_THAT(result.words("connection"),
                StartsWith("127.0.0.1 port " + std::to_string(port.getPort()) +
                           " refuses connections\ncheck whether the gateway runs"));
}

TEST(ToolDoctor, GivesUpAServerThatNeverAnswers) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(Answer::never());
    const DoctorResult result = runDoctor(server.getUrl(), {"--timeout", "1"});
    EXPECT_EQ(1, result.status);
    EXPECT_EQ("name connection tls path", result.names());
    EXPECT_EQ("well", result.verdict("connection"));
    EXPECT_THAT(result.words("path"),
                StartsWith("the request was sent, but nothing answered within 1 s\n"));
}

TEST(ToolDoctor, SaysThatAConnectionEndsWithoutAnAnswer) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(Answer::closing());
    const DoctorResult result = runDoctor(server.getUrl(), QUICKLY);
    EXPECT_EQ(1, result.status);
    EXPECT_THAT(result.words("path"), StartsWith("the connection ended without an answer: "));
}

TEST(ToolDoctor, NamesAPathThatIsNotServedAndARedirect) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(Answer::status(404, {{"Content-Type", "text/plain"}}, "no such\nx"));
    const DoctorResult missing = runDoctor(server.getUrl(), QUICKLY);
    EXPECT_EQ(1, missing.status);
    EXPECT_THAT(missing.words("path"),
                StartsWith("/asrgw is not served here: status 404 (no such)"));
    server.script({resultAnswer("")});
    EXPECT_THAT(runDoctor(server.getUrl(), QUICKLY).words("path"),
                StartsWith("/asrgw_chunked is not served here: status 404"));
    server.setDefaultAnswer(Answer::status(301, {{"Location", "https://b.example/\x1b[2J"}}));
    EXPECT_THAT(runDoctor(server.getUrl(), QUICKLY).words("path"),
                StartsWith("/asrgw redirects to https://b.example/?[2J (status 301); no session "
                           "follows that\n"));
}

TEST(ToolDoctor, SaysWhatItCannotKnowWithoutAReport) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(resultAnswer(UNDERSTOOD));
    const DoctorResult result = runDoctor(server.getUrl() + "/asrgw", QUICKLY);
    EXPECT_EQ(1, result.status);
    EXPECT_EQ(ALL, result.names());
    EXPECT_EQ("unknown", result.verdict("streamed"));
    EXPECT_THAT(result.words("streamed"),
                HasSubstr("the gateway does not report when the pieces arrived"));
    for (const char* const name : {"name", "connection", "path", "whole", "size"}) {
        EXPECT_EQ("well", result.verdict(name)) << result.words(name);
    }
    EXPECT_EQ("skipped", result.verdict("tls"));
    EXPECT_EQ("skipped", result.verdict("kept"));
    ASSERT_EQ(5U, server.getRequestCount());
    const ScriptedHttpServer::Request streamed = server.getRequest(3);
    EXPECT_THAT(streamed.line(), StartsWith("POST /asrgw_chunked?uuid="));
    EXPECT_EQ(20U, streamed.chunkSizes.size());
    EXPECT_EQ("report", streamed.header("x-asrgw-arrivals"));
    EXPECT_THAT(server.getRequest(2).line(), StartsWith("POST /asrgw?uuid="));
}

/** An answer whose report says that the body arrived as given. */
Answer reporting(const std::string& report) {
    std::string text =
        "HTTP/1.1 200 OK\r\nContent-Length: 0\r\nx-asrgw-recognition-results: YQ==\r\n";
    return Answer::raw(text + "x-asrgw-arrivals: " + report + "\r\n\r\n");
}

TEST(ToolDoctor, TellsACollectedRequestFromOneThatIsPassedOn) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(reporting("pieces=20 first=1ms last=1901ms gap=104ms answer=5ms"));
    const DoctorResult passed = runDoctor(server.getUrl(), QUICKLY);
    EXPECT_EQ(0, passed.status);
    EXPECT_EQ("well", passed.verdict("streamed"));
    EXPECT_EQ(true, passed.report()["well"]);
    EXPECT_EQ(104, passed.check("streamed")["gapMs"]);
    EXPECT_EQ(20, passed.check("streamed")["pieces"]);
    server.setDefaultAnswer(reporting("pieces=2 first=0ms last=3ms gap=3ms answer=5ms"));
    const DoctorResult collected = runDoctor(server.getUrl(), QUICKLY);
    EXPECT_EQ(1, collected.status);
    EXPECT_EQ("problem", collected.verdict("streamed"));
    EXPECT_THAT(collected.words("streamed"),
                StartsWith("something between here and the gateway collects the request before it "
                           "passes it on: sent in "));
    EXPECT_THAT(collected.words("streamed"),
                HasSubstr("\nwith nginx set proxy_request_buffering off and proxy_http_version "
                          "1.1"));
}

TEST(ToolDoctor, AsksTwiceBeforeItBlamesAFront) {
    ScriptedHttpServer server;
    const Answer starved = reporting("pieces=20 first=1950ms last=1960ms gap=1ms answer=5ms");
    const Answer usual = reporting("pieces=20 first=1ms last=1901ms gap=104ms answer=5ms");
    server.script({usual, usual, usual, starved});
    server.setDefaultAnswer(usual);
    const DoctorResult result = runDoctor(server.getUrl(), QUICKLY);
    EXPECT_EQ(0, result.status) << result.words("streamed");
    EXPECT_EQ(6U, server.getRequestCount());
}

TEST(ToolDoctor, FindsWhatIsNoGateway) {
    ScriptedHttpServer server;
    const DoctorResult result = runDoctor(server.getUrl(), QUICKLY);
    EXPECT_EQ(1, result.status);
    EXPECT_THAT(result.words("whole"),
                StartsWith("status 200 without x-asrgw-recognition-results: what answers is no "
                           "recognition gateway"));
}

TEST(ToolDoctor, SaysThatConnectionsAreNotKept) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(resultAnswer(UNDERSTOOD).thenClose());
    const DoctorResult result = runDoctor(server.getUrl(), {"--idle", "20"});
    EXPECT_EQ("problem", result.verdict("kept"));
    EXPECT_THAT(result.words("kept"), MatchesRegex("(connections are closed after each answer|kept "
                                                   "connections are closed after .* s)\n.*"));
}

TEST(ToolDoctor, PrintsALineForEachCheck) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(reporting("pieces=20 first=1ms last=1901ms gap=104ms answer=5ms"));
    const ToolResult result = runTalvox({"doctor", server.getUrl(), "--idle", "0"});
    EXPECT_EQ(0, result.status) << result.err;
    EXPECT_THAT(result.out,
                StartsWith("well     name                   127.0.0.1 is an address, no name to "
                           "look up\nwell     connection  "));
    EXPECT_THAT(result.out,
                HasSubstr("\nskipped  kept                   not watched\nall is well\n"));
    const RefusingPort port;
    const ToolResult refused = runTalvox({"doctor", port.getUrl()});
    EXPECT_EQ(1, refused.status);
    EXPECT_THAT(refused.out, ::testing::EndsWith("\n1 problem\n"));
}

TEST(ToolDoctor, RefusesWrongUsage) {
    const std::vector<std::vector<std::string>> wrongs = {
        {"doctor"},
        {"doctor", "ftp://127.0.0.1"},
        {"doctor", "http://127.0.0.1:1", "--timeout", "0"},
        {"doctor", "http://127.0.0.1:1", "--idle", "-1"},
        {"doctor", "http://127.0.0.1:1", "--lang", ""},
        {"doctor", "https://127.0.0.1:1", "--ca-file", "/nowhere"}};
    for (const std::vector<std::string>& wrong : wrongs) {
        const ToolResult result = runTalvox(wrong);
        EXPECT_EQ(2, result.status) << ::testing::PrintToString(wrong);
        EXPECT_EQ("", result.out);
        EXPECT_THAT(result.err, StartsWith("talvox: "));
    }
}

/** Servers with certificates of an authority that this machine does not know. */
class ToolDoctorTls : public ::testing::Test {
  protected:
    void SetUp() override {
        if (!TlsRelay::isAvailable()) {
            GTEST_SKIP() << "needs openssl and socat";
        }
        ASSERT_EQ("", makeCertificate(directory.path("authority"), "DNS:authority"));
        server.setDefaultAnswer(reporting("pieces=20 first=1ms last=1901ms gap=104ms answer=5ms"));
    }

    /** Examines a server whose certificate names this host for so many days. */
    DoctorResult examine(const std::string& subject, int days, bool trusts) {
        EXPECT_EQ("", makeSignedCertificate(directory.path("server"), directory.path("authority"),
                                            subject, days));
        const TlsRelay relay(directory.path("server"), server.getPort());
        std::vector<std::string> options = QUICKLY;
        if (trusts) {
            options.insert(options.end(), {"--ca-file", directory.path("authority.pem")});
        }
        return runDoctor(relay.getUrl(), options);
    }

    const ScratchDirectory directory;
    ScriptedHttpServer server;
};

TEST_F(ToolDoctorTls, DescribesACertificate) {
    const DoctorResult result = examine("IP:127.0.0.1", 90, true);
    EXPECT_EQ(0, result.status) << result.output;
    EXPECT_EQ("well", result.verdict("tls"));
    EXPECT_THAT(result.words("tls"), MatchesRegex("issued by CN = talvox test, (89|90) days left, "
                                                  "names 127\\.0\\.0\\.1\n"));
    EXPECT_THAT(result.check("tls")["daysLeft"].get<int>(), ::testing::AnyOf(89, 90));
}

TEST_F(ToolDoctorTls, FindsAnUnknownAuthority) {
    const DoctorResult result = examine("IP:127.0.0.1", 90, false);
    EXPECT_EQ(1, result.status);
    EXPECT_EQ("name connection tls", result.names());
    EXPECT_THAT(result.words("tls"),
                StartsWith("the certificate is signed by an authority unknown here, see --ca-file; "
                           "its issuer is CN = talvox test\n"));
    EXPECT_EQ(0U, server.getRequestCount());
}

TEST_F(ToolDoctorTls, FindsAWrongName) {
    const DoctorResult result = examine("DNS:other.example", 90, true);
    EXPECT_EQ(1, result.status);
    EXPECT_THAT(result.words("tls"),
                StartsWith("the certificate does not name 127.0.0.1; it names other.example\n"));
}

TEST_F(ToolDoctorTls, FindsACertificateThatExpiredOrSoonWill) {
    EXPECT_THAT(examine("IP:127.0.0.1", -1, true).words("tls"),
                StartsWith("the certificate expired on "));
    const DoctorResult soon = examine("IP:127.0.0.1", 3, true);
    EXPECT_EQ(1, soon.status);
    EXPECT_THAT(soon.words("tls"),
                MatchesRegex("the certificate is valid for [23] days only, until .*\n.*"));
}

TEST_F(ToolDoctorTls, SaysThatAPortDoesNotSpeakTls) {
    server.setDefaultAnswer(Answer::raw("nonsense").thenClose());
    const std::string url = "https://127.0.0.1:" + std::to_string(server.getPort());
    const DoctorResult result = runDoctor(url, {"--timeout", "2"});
    EXPECT_EQ(1, result.status);
    EXPECT_EQ("problem", result.verdict("tls"));
    EXPECT_THAT(result.words("tls"), HasSubstr("check that the port speaks TLS"));
}

}  // namespace
