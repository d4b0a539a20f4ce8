#include <gtest/gtest.h>

#include <csignal>
#include <string>
#include <vector>

#include "gateway/Bodies.h"
#include "gateway/HttpClient.h"
#include "support/ChildProcess.h"

namespace {

using TestSupport::ChildProcess;

/** Reads until a line begins with `start`. @return the line, empty when the program ended before */
std::string readLine(ChildProcess& program, const std::string& start) {
    std::string output;
    for (std::string piece = program.read(); !piece.empty(); piece = program.read()) {
        output += piece;
        const std::size_t begin = output.find(start);
        const std::size_t end = begin == std::string::npos ? begin : output.find('\n', begin);
        if (end != std::string::npos) {
            return output.substr(begin, end - begin);
        }
    }
    return std::string();
}

}  // namespace

TEST(GatewayProgram, ServesFromItsReadyLineToTheSignal) {
    for (const int signal : {SIGINT, SIGTERM}) {
        ChildProcess program({GATEWAY_BINARY, "--port", "0"});
        const std::string start = "talvox-gateway listening on http://127.0.0.1:";
        const std::string line = readLine(program, start);
        ASSERT_EQ(0U, line.find(start)) << line;
        const int port = std::stoi(line.substr(start.size()));
        GatewayTest::HttpClient client(static_cast<uint16_t>(port));
        const std::string body =
            GatewayTest::parts(GatewayTest::usualFields()) + GatewayTest::closing();
        client.send(GatewayTest::requestHead("/asrgw?uuid=u1", static_cast<long>(body.size())) +
                    body);
        EXPECT_EQ(200, client.read().status);
        program.sendSignal(signal);
        EXPECT_EQ(0, program.wait());
    }
}

TEST(GatewayProgram, ExplainsItself) {
    const ChildProcess::Result help = ChildProcess::run({GATEWAY_BINARY, "--help"});
    EXPECT_EQ(0, help.exitStatus);
    for (const char* text :
         {"loopback", "--host", "--port", "--model-dir", "--lm", "--dict", "--max-body", "16777216",
          "from 1 to 1073741824", "--decoders", "from 1 to 64", "--decoder-wait", "4000",
          "from 0 to 60000", "from 0 to 65535", "--lang", "--log-file", "--page", "--verbose"}) {
        EXPECT_NE(std::string::npos, help.output.find(text)) << text;
    }
    const ChildProcess::Result version = ChildProcess::run({GATEWAY_BINARY, "--version"});
    EXPECT_EQ(0, version.exitStatus);
    EXPECT_EQ(0U, version.output.find("talvox-gateway 133 ("));
}

TEST(GatewayProgram, RefusesWrongUsage) {
    std::vector<std::vector<std::string>> wrongs = {
        {"--nonsense"}, {"--lang", ""}, {"--port", "-1"}, {"--port", "65536"}};
    for (const char* option : {"--port", "--decoders", "--decoder-wait", "--max-body"}) {
        for (const char* value :
             {"http", "", " ", "-1", "1x", "1.5", "010", "0x10", "99999999999999999999"}) {
            wrongs.push_back({option, value});
        }
    }
    for (const char* value : {"0", "65"}) {
        wrongs.push_back({"--decoders", value});
    }
    for (const char* value : {"0", "1073741825"}) {
        wrongs.push_back({"--max-body", value});
    }
    wrongs.push_back({"--decoder-wait", "60001"});
    for (const std::vector<std::string>& wrong : wrongs) {
        std::vector<std::string> command = {GATEWAY_BINARY};
        command.insert(command.end(), wrong.begin(), wrong.end());
        const ChildProcess::Result refusal = ChildProcess::run(command);
        EXPECT_EQ(2, refusal.exitStatus) << ::testing::PrintToString(wrong);
        EXPECT_EQ(0U, refusal.output.find("talvox-gateway: ")) << refusal.output;
        EXPECT_NE(std::string::npos, refusal.output.find(wrong[0])) << refusal.output;
        EXPECT_EQ(refusal.output.size() - 1, refusal.output.find('\n')) << refusal.output;
    }
    const ChildProcess::Result result =
        ChildProcess::run({GATEWAY_BINARY, "--port", "0", "--lm", "/nowhere"});
    EXPECT_EQ(1, result.exitStatus);
    EXPECT_NE(std::string::npos,
              result.output.find("talvox-gateway: cannot read the model's file /nowhere"));
}

TEST(GatewayProgram, KeepsThePageOnThisMachine) {
    const ChildProcess::Result open =
        ChildProcess::run({GATEWAY_BINARY, "--page", "--host", "0.0.0.0", "--port", "0"});
    EXPECT_EQ(1, open.exitStatus);
    EXPECT_EQ(
        "talvox-gateway: the page shows what all clients say, so it needs a loopback address; "
        "0.0.0.0 is none\n",
        open.output);
    ChildProcess program({GATEWAY_BINARY, "--page", "--port", "0"});
    EXPECT_NE("", readLine(program, "the last sessions are shown at http://127.0.0.1:"));
}
