// What "talvox recognize" says about sessions that a gateway or the network ends.
#include <gmock/gmock.h>

#include <nlohmann/json.hpp>

#include "RecognizeRun.h"
#include "ToolProcess.h"
#include "support/ScratchDirectory.h"
#include "support/ScriptedHttpServer.h"

namespace {

using ::testing::EndsWith;
using ::testing::MatchesRegex;
using TestSupport::Answer;
using TestSupport::lines;
using TestSupport::recognize;
using TestSupport::RefusingPort;
using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;
using TestSupport::ScriptedHttpServer;
using TestSupport::ToolResult;
using TestSupport::voice;

const std::string ENDED = "talvox: recognition ended with ErrorNetwork: ";

/** The reason of the error that a recognition ends with, as all of its outputs give it. */
std::string reasonAt(const std::string& url, const std::vector<std::string>& more = {}) {
    const ScratchDirectory directory;
    std::vector<std::string> options = {"--events", directory.path("events")};
    options.insert(options.end(), more.begin(), more.end());
    const ToolResult result = runTalvox(recognize(url, options), voice());
    EXPECT_EQ(result.status, 1);
    const std::vector<std::string> events = lines(ScratchDirectory::read(directory.path("events")));
    if (events.empty()) {
        ADD_FAILURE() << "no events";
        return "";
    }
    const nlohmann::json last = nlohmann::json::parse(events.back());
    EXPECT_EQ(last["name"], "ErrorNetwork");
    const std::string reason = last.value("reason", "");
    EXPECT_THAT(result.out, EndsWith(" ms  error: ErrorNetwork: " + reason + "\n"));
    EXPECT_EQ(result.err.compare(0, ENDED.size() + reason.size(), ENDED + reason), 0) << result.err;
    const std::string hint = result.err.substr(ENDED.size() + reason.size());
    return reason + hint.substr(0, hint.size() - 1);
}

TEST(ToolErrors, GivesTheStatusOfTheAnswer) {
    ScriptedHttpServer server;
    for (const int status : {404, 413}) {
        server.setDefaultAnswer(Answer::status(status));
        for (const char* const protocol : {"--streaming", "--no-streaming"}) {
            EXPECT_EQ(reasonAt(server.getUrl(), {protocol}),
                      "HTTP status " + std::to_string(status));
        }
    }
}

TEST(ToolErrors, SaysThatTheServiceIsBusy) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(Answer::status(503, {{"Retry-After", "4"}}));
    EXPECT_EQ(reasonAt(server.getUrl()), "HTTP status 503 (the service is busy)");
}

TEST(ToolErrors, NamesAHostThatDoesNotResolve) {
    EXPECT_EQ(reasonAt("http://gateway.invalid:8090"), "Could not resolve host: gateway.invalid");
}

TEST(ToolErrors, AsksForAGatewayWhereNothingListens) {
    const RefusingPort port;
    EXPECT_THAT(reasonAt(port.getUrl(), {"--streaming"}),
                MatchesRegex("Failed to connect to 127\\.0\\.0\\.1 port [0-9]+ after [0-9]+ ms: "
                             "Couldn't connect to server \\(is a gateway running at " +
                             port.getUrl() + "\\?\\)"));
}

TEST(ToolErrors, SaysHowLongItWaitedForAnAnswer) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(Answer::never());
    EXPECT_EQ(reasonAt(server.getUrl(), {"--streaming"}), "no answer within 20 s");
}

TEST(ToolErrors, PrintsTheReasonWithJsonAsWell) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(Answer::status(404));
    const ToolResult result = runTalvox(recognize(server.getUrl(), {"--json"}), voice());
    EXPECT_EQ(result.status, 1);
    EXPECT_THAT(lines(result.out).back(),
                MatchesRegex("\\{\"event\":\"error\",\"ms\":[0-9]+,\"code\":3,"
                             "\"name\":\"ErrorNetwork\",\"reason\":\"HTTP status 404\"\\}"));
    EXPECT_EQ(result.err, ENDED + "HTTP status 404\n");
}

}  // namespace
