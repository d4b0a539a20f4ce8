#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <fstream>
#include <memory>
#include <sstream>

#include "core/util/UrlCoder.h"
#include "gateway/HttpClient.h"
#include "gateway/Server.h"
#include "support/ChildProcess.h"
#include "support/LogCapture.h"
#include "support/ScratchDirectory.h"

namespace {

using Gateway::Server;
using Gateway::ServerOptions;
using GatewayTest::HttpAnswer;
using GatewayTest::HttpClient;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::MatchesRegex;

/** A gateway that keeps its records in a file. Loading its model takes time, so one serves all. */
class LogEndpointTest : public ::testing::Test {
  protected:
    struct Gateway {
        Gateway() : path(directory.path("records")), server(options()) {
            EXPECT_EQ("", server.start());
        }

        ServerOptions options() const {
            ServerOptions wanted;
            wanted.port = 0;
            wanted.recordFile = path;
            return wanted;
        }

        const TestSupport::ScratchDirectory directory;
        const std::string path;
        Server server;
    };

    static void TearDownTestSuite() { gateway().reset(); }

    LogEndpointTest() {
        if (!gateway()) {
            gateway() = std::make_unique<Gateway>();
        }
        start = whole().size();
    }

    static HttpAnswer ask(const std::string& target, const std::string& method = "GET") {
        HttpClient client(gateway()->server.getPort());
        client.send(GatewayTest::requestHead(target, 0, method));
        return client.read();
    }

    /** What the file has got since the test began. */
    std::string content() const { return whole().substr(start); }

    static std::unique_ptr<Gateway>& gateway() {
        static std::unique_ptr<Gateway> running;
        return running;
    }

    const TestSupport::LogCapture log;

  private:
    static std::string whole() {
        std::ostringstream text;
        text << std::ifstream(gateway()->path, std::ios::binary).rdbuf();
        return text.str();
    }

    std::size_t start = 0;
};

TEST_F(LogEndpointTest, KeepsARecordWithItsTime) {
    const HttpAnswer answer = ask("/log?uuid=u1&logmessage=time%3D1%3Bname%3Da%20b%2B");
    EXPECT_EQ(200, answer.status);
    EXPECT_EQ("", answer.body);
    EXPECT_THAT(content(), MatchesRegex("20[0-9-]+T[0-9:]+Z uuid=u1 time=1;name=a b\\+\n"));
}

TEST_F(LogEndpointTest, KeepsEveryByte) {
    std::string bytes;
    for (int value = 0; value < 256; ++value) {
        bytes += static_cast<char>(value);
    }
    EXPECT_EQ(200, ask("/log?uuid=&logmessage=" + Util::UrlCoder::urlEncodeString(bytes)).status);
    EXPECT_THAT(content(), HasSubstr(" uuid= \\x00\\x01"));
    EXPECT_THAT(content(), HasSubstr("\\x1f !\"#$%&'()*+,-./0123456789:;<=>?@"));
    EXPECT_THAT(content(), EndsWith("}~\\x7f" + bytes.substr(128) + "\n"));
}

TEST_F(LogEndpointTest, KeepsTheLongestRecordThatTheCollectorSends) {
    const std::string longest(1000000, 'a');
    EXPECT_EQ(200, ask("/log?uuid=u&logmessage=" + longest).status);
    EXPECT_TRUE(content().find(" uuid=u " + longest + "\n") != std::string::npos);
}

TEST_F(LogEndpointTest, ServesManyOnOneConnection) {
    HttpClient client(gateway()->server.getPort());
    for (int i = 0; i < 100; ++i) {
        ASSERT_TRUE(client.send(
            GatewayTest::requestHead("/log?uuid=u&logmessage=r" + std::to_string(i), 0, "GET")));
        ASSERT_EQ(200, client.read().status);
    }
    EXPECT_THAT(content(), HasSubstr(" uuid=u r99\n"));
}

TEST_F(LogEndpointTest, RefusesMalformedRequests) {
    for (const char* target :
         {"/log", "/log?uuid=u", "/log?logmessage=r",
          "/log?uuid=u&logmessage=", "/log?uuid=u&logmessage", "/log?uuid&logmessage=r",
          "/log?uuid=u&logmessage=%", "/log?uuid=u&logmessage=a%2", "/log?uuid=u&logmessage=%zz",
          "/log?uuid=%g0&logmessage=r"}) {
        const HttpAnswer answer = ask(target);
        EXPECT_EQ(400, answer.status) << target;
        EXPECT_NE("", answer.body) << target;
    }
    EXPECT_EQ("", content());
    EXPECT_TRUE(log.containsPart("GET /log 400 uuid=u refused: \"there is no logmessage\""));
}

TEST_F(LogEndpointTest, RefusesOtherMethodsAndPaths) {
    const HttpAnswer answer = ask("/log?uuid=u&logmessage=r", "POST");
    EXPECT_EQ(405, answer.status);
    EXPECT_EQ("GET", answer.headers.at("allow"));
    EXPECT_EQ(404, ask("/log/?uuid=u&logmessage=r").status);
    EXPECT_EQ("", content());
}

TEST(GatewayRecords, GoToTheStandardOutputByDefault) {
    TestSupport::ChildProcess program({GATEWAY_BINARY, "--port", "0"});
    const std::string start = "listening on http://127.0.0.1:";
    std::string output;
    while (output.find('\n', output.find(start)) == std::string::npos ||
           output.find(start) == std::string::npos) {
        const std::string piece = program.read();
        ASSERT_NE("", piece);
        output += piece;
    }
    HttpClient client(
        static_cast<uint16_t>(std::stoi(output.substr(output.find(start) + start.size()))));
    client.send(GatewayTest::requestHead("/log?uuid=u&logmessage=hello", 0, "GET"));
    EXPECT_EQ(200, client.read().status);
    program.sendSignal(SIGTERM);
    for (std::string piece = program.read(); !piece.empty(); piece = program.read()) {
        output += piece;
    }
    EXPECT_EQ(0, program.wait());
    EXPECT_THAT(output, HasSubstr("Z uuid=u hello\n"));
}

TEST(GatewayRecords, NeedAFileThatCanBeWritten) {
    const TestSupport::ChildProcess::Result result = TestSupport::ChildProcess::run(
        {GATEWAY_BINARY, "--port", "0", "--log-file", "/nowhere/records"});
    EXPECT_EQ(1, result.exitStatus);
    EXPECT_THAT(result.output, HasSubstr("talvox-gateway: cannot write the log of records "
                                         "/nowhere/records: No such file or directory"));
}

}  // namespace
