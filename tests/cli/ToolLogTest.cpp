// The tool sends usage events through the collector, to a scripted endpoint and the real gateway.
#include <gmock/gmock.h>

#include <csignal>

#include "ToolProcess.h"
#include "support/ScratchDirectory.h"
#include "support/ScriptedHttpServer.h"

namespace {

using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::MatchesRegex;
using TestSupport::Answer;
using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;
using TestSupport::ScriptedHttpServer;
using TestSupport::ToolProcess;
using TestSupport::ToolResult;

TEST(ToolLog, SendsAnEventAndWaitsForItsDelivery) {
    ScriptedHttpServer server;
    const ToolResult result = runTalvox({"log", "--url", server.getUrl() + "/log", "--uuid", "u1",
                                         "--session", "s", "opened", "b=1", "a=x=y z"});
    EXPECT_EQ(0, result.status);
    EXPECT_EQ("", result.out);
    EXPECT_EQ("", result.err);
    ASSERT_EQ(1U, server.getRequestCount());
    EXPECT_THAT(server.getRequest(0).line(),
                MatchesRegex("GET /log\\?uuid=u1&logmessage=time%3D[0-9A-F%-]+%3BsessionId%3Ds"
                             "%3Btype%3Devent%3Bname%3Dopened%3Ba%3Dx%3Dy%20z%3Bb%3D1 HTTP/1.1"));
}

TEST(ToolLog, SendsAnError) {
    ScriptedHttpServer server;
    EXPECT_EQ(
        0,
        runTalvox({"log", "--url", server.getUrl(), "--session", "s", "--error", "lost"}).status);
    EXPECT_THAT(server.getRequest(0).line(), HasSubstr("%3Btype%3Derror%3Bname%3Dlost HTTP"));
}

TEST(ToolLog, SaysHowManyAreLeftWhenTheTimeIsOver) {
    const TestSupport::RefusingPort port;
    const ToolResult result =
        runTalvox({"log", "--url", port.getUrl(), "--session", "s", "--timeout", "0", "n"});
    EXPECT_EQ(1, result.status);
    EXPECT_THAT(result.err, EndsWith("talvox: 1 record is not delivered\n"));
}

TEST(ToolLog, KeepsInAStoreWhatIsNotDelivered) {
    const ScratchDirectory directory;
    const std::string store = directory.path("store");
    const TestSupport::RefusingPort port;
    const auto log = [&store](const std::string& url, const std::string& name,
                              const std::string& timeout) {
        return runTalvox({"log", "--url", url, "--session", "s", "--verbosity", "0", "--store",
                          store, "--timeout", timeout, name});
    };
    EXPECT_EQ("talvox: 1 record is not delivered, it stays in " + store + "\n",
              log(port.getUrl(), "one", "0").err);
    const ToolResult second = log(port.getUrl(), "two", "0");
    EXPECT_EQ("talvox: 2 records are not delivered, they stay in " + store + "\n", second.err);
    EXPECT_EQ(1, second.status);
    ScriptedHttpServer server;
    const ToolResult third = log(server.getUrl(), "three", "30");
    EXPECT_EQ("", third.err);
    EXPECT_EQ(0, third.status);
    ASSERT_EQ(3U, server.getRequestCount());
    EXPECT_THAT(server.getRequest(0).line(), HasSubstr("name%3Done "));
    EXPECT_THAT(server.getRequest(1).line(), HasSubstr("name%3Dtwo "));
    EXPECT_THAT(server.getRequest(2).line(), HasSubstr("name%3Dthree "));
    EXPECT_EQ(0, log(server.getUrl(), "four", "30").status);
    EXPECT_EQ(4U, server.getRequestCount());
}

TEST(ToolLog, SendsAlsoWithoutTheStore) {
    ScriptedHttpServer server;
    const ToolResult result =
        runTalvox({"log", "--url", server.getUrl(), "--session", "s", "--store", "/dev/null", "n"});
    EXPECT_EQ(0, result.status);
    EXPECT_EQ(
        "talvox: LogStore: /dev/null is not used, records are in memory only: Not a directory\n",
        result.err);
    EXPECT_EQ(1U, server.getRequestCount());
}

TEST(ToolLog, EndsInTheMiddleOfARequest) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(Answer::never());
    ToolProcess process(TALVOX_BINARY, {"log", "--url", server.getUrl(), "--session", "s", "n"});
    ASSERT_TRUE(server.waitForRequest(1));
    process.signal(SIGINT);
    const ToolResult result = process.wait();
    EXPECT_EQ(1, result.status);
    EXPECT_EQ("talvox: 1 record is not delivered\n", result.err);
}

TEST(ToolLog, RefusesWrongUsage) {
    const auto expectRefused = [](const std::vector<std::string>& arguments,
                                  const std::string& reason) {
        const ToolResult result = runTalvox(arguments);
        EXPECT_EQ(2, result.status) << reason;
        EXPECT_THAT(result.err, HasSubstr(reason));
    };
    expectRefused({"log"}, "required");
    expectRefused({"log", "--session", "s"}, "name is required");
    expectRefused({"log", "n"}, "--session is required");
    expectRefused({"log", "--session", "s", "n", "k"}, "parameter k: expected key=value");
    expectRefused({"log", "--session", "s", "n", "=v"}, "parameter =v: expected key=value");
    expectRefused({"log", "--session", "s", "n", "k=1", "k=2"}, "parameter k is given twice");
    expectRefused({"log", "--session", "s", "--timeout", "soon", "n"}, "--timeout");
    expectRefused({"log", "--session", "s", "--verbosity", "3", "n"}, "--verbosity");
    expectRefused({"log", "--session", "s", "--store", "", "n"}, "the folder has no name");
    expectRefused({"log", "--session", "s", "--url", "nonsense", "n"},
                  "talvox: the address \"nonsense\" is neither http nor https\n");
    expectRefused({"log", "--session", "s", "--url", "", "n"}, "talvox: the address is empty\n");
    expectRefused({"log", "--session", "s", "--uuid", "u 1", "n"},
                  "talvox: the uuid \"u 1\" has a blank or control character\n");
}

TEST(ToolLog, ReachesTheGateway) {
    const ScratchDirectory directory;
    const std::string records = directory.path("records");
    ToolProcess gateway(GATEWAY_BINARY, {"--port", "0", "--log-file", records});
    const std::string line = gateway.waitForLine("listening on");
    const std::string url = line.substr(line.find("http://")) + "/log";
    const ToolResult result = runTalvox(
        {"log", "--url", url, "--uuid", "u1", "--session", "s", "--error", "n", "k=one\ntwo"});
    EXPECT_EQ(0, result.status) << result.err;
    gateway.signal(SIGTERM);
    EXPECT_EQ(0, gateway.wait().status);
    EXPECT_THAT(ScratchDirectory::read(records),
                MatchesRegex("20[0-9-]+T[0-9:]+Z uuid=u1 time=[0-9 :-]+;sessionId=s;type=error;"
                             "name=n;k=one\\\\x0atwo\n"));
}

}  // namespace
