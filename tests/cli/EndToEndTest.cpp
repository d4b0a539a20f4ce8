// The whole way: the tool plays recorded speech through a session to the real gateway.
#include <gmock/gmock.h>

#include <csignal>
#include <fstream>
#include <nlohmann/json.hpp>

#include "ToolProcess.h"
#include "support/ScratchDirectory.h"

namespace {

using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;
using TestSupport::ToolProcess;
using TestSupport::ToolResult;

/** Where Debian's pocketsphinx-testdata puts its recordings. */
const char* const RECORDINGS = "/usr/share/pocketsphinx/test/data/";

/** The last event of a session with a recording. */
nlohmann::json recognise(const std::string& url, const std::string& name,
                         const std::vector<std::string>& options) {
    std::vector<std::string> arguments = {"recognize", "--json", "--file", "-",
                                          "--rate",    "16000",  "--url",  url};
    arguments.insert(arguments.end(), options.begin(), options.end());
    const ToolResult result = runTalvox(arguments, ScratchDirectory::read(RECORDINGS + name));
    EXPECT_EQ(result.status, 0) << result.err;
    const std::size_t last = result.out.rfind('\n', result.out.size() - 2);
    return nlohmann::json::parse(result.out.substr(last == std::string::npos ? 0 : last + 1));
}

TEST(EndToEnd, RecognisesRecordedSpeechInBothModes) {
    if (!std::ifstream(std::string(RECORDINGS) + "goforward.raw")) {
        GTEST_SKIP() << "needs the package pocketsphinx-testdata";
    }
    ToolProcess gateway(GATEWAY_BINARY, {"--port", "0"});
    const std::string line = gateway.waitForLine("listening on");
    ASSERT_NE(line, "");
    const std::string url = line.substr(line.rfind(' ') + 1);

    const nlohmann::json simple =
        recognise(url, "goforward.raw", {"--no-streaming", "--format", "pcm"});
    EXPECT_EQ(simple["event"], "results");
    EXPECT_EQ(simple["hypotheses"][0]["text"], "go forward ten meters");
    EXPECT_NE(simple["outcome"], "rejected");
    const nlohmann::json chunked =
        recognise(url, "something.raw", {"--streaming", "--format", "speex"});
    EXPECT_EQ(chunked["hypotheses"][0]["text"], "go somewhere and do something");
    EXPECT_NE(chunked["requestId"], simple["requestId"]);

    gateway.signal(SIGTERM);
    EXPECT_EQ(gateway.wait().status, 0);
}

}  // namespace
