// "talvox recognize" while the system gives it few descriptors or no threads: it ends soon, with
// one end and a status that says so.
#include <gmock/gmock.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "RecognizeRun.h"
#include "ToolProcess.h"
#include "support/ScratchDirectory.h"
#include "support/ScriptedHttpServer.h"

namespace {

using ::testing::AnyOf;
using ::testing::Eq;
using ::testing::HasSubstr;
using TestSupport::recognize;
using TestSupport::ScriptedHttpServer;
using TestSupport::ToolProcess;
using TestSupport::ToolResult;
using TestSupport::voice;

const int OK = 0;
const int ENDED_IN_ERROR = 1;
const int LOADER_FAILED = 127;

const char* const PRLIMIT = "/usr/bin/prlimit";
const char* const SETPRIV = "/usr/bin/setpriv";

std::size_t countEnds(const std::string& output) {
    std::size_t count = 0;
    for (const std::string& line : TestSupport::lines(output)) {
        const bool isEnd = line.find("\"event\":\"results\"") != std::string::npos ||
                           line.find("\"event\":\"error\"") != std::string::npos;
        count += isEnd ? 1 : 0;
    }
    return count;
}

class ToolLimitsTest : public ::testing::TestWithParam<int> {
  protected:
    void SetUp() override {
#if defined(__SANITIZE_THREAD__)
        GTEST_SKIP() << "ThreadSanitizer needs threads and descriptors of its own";
#endif
    }
};

class ToolDescriptorsTest : public ToolLimitsTest {};

TEST_P(ToolDescriptorsTest, EndsOnceAndSaysHow) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(TestSupport::resultAnswer("<variant confidence=\"0.9\">go</variant>"));
    std::vector<std::string> words = {"--nofile=" + std::to_string(GetParam()), TALVOX_BINARY};
    const std::vector<std::string> arguments = recognize(server.getUrl(), {"--json"});
    words.insert(words.end(), arguments.begin(), arguments.end());
    ToolProcess tool(PRLIMIT, words, voice());
    const ToolResult result = tool.wait();
    SCOPED_TRACE(result.out + result.err);
    if (result.err.find("object has invalid vptr") != std::string::npos) {
        GTEST_SKIP() << "UndefinedBehaviorSanitizer has no descriptors for a check of its own";
    }
    if (result.status == LOADER_FAILED) {
        EXPECT_THAT(result.err, HasSubstr("error while loading shared libraries"));
        return;
    }
    EXPECT_THAT(result.status, AnyOf(Eq(OK), Eq(ENDED_IN_ERROR)));
    EXPECT_EQ(countEnds(result.out), 1u);
    EXPECT_EQ(result.status == OK, result.err.find("recognition ended with") == std::string::npos);
}

INSTANTIATE_TEST_SUITE_P(Limits, ToolDescriptorsTest,
                         ::testing::Values(3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 16, 20, 32,
                                           64));

class ToolFileSizeTest : public ToolLimitsTest {};

TEST_P(ToolFileSizeTest, SaysThatTheDumpIsNotCompleteThoughItsHeaderIsTrue) {
    const TestSupport::ScratchDirectory directory;
    ScriptedHttpServer server;
    server.setDefaultAnswer(TestSupport::resultAnswer("<variant confidence=\"0.9\">go</variant>"));
    std::vector<std::string> words = {"--fsize=" + std::to_string(GetParam()), TALVOX_BINARY};
    const std::vector<std::string> arguments =
        recognize(server.getUrl(), {"--json", "--dump", directory.path()});
    words.insert(words.end(), arguments.begin(), arguments.end());
    ToolProcess tool(PRLIMIT, words, voice());
    const ToolResult result = tool.wait();
    EXPECT_EQ(result.status, ENDED_IN_ERROR);
    EXPECT_THAT(TestSupport::lines(result.out).back(), HasSubstr("\"event\":\"results\""));
    const std::string path = directory.path("in.wav");
    EXPECT_EQ(result.err, "talvox: the dump " + path + " is not complete\n");
    EXPECT_EQ(TestSupport::ScratchDirectory::read(path).size(),
              static_cast<std::size_t>(GetParam()));
}

INSTANTIATE_TEST_SUITE_P(Limits, ToolFileSizeTest, ::testing::Values(44, 45, 20000));

class ToolThreadsTest : public ToolLimitsTest {};

TEST_P(ToolThreadsTest, EndsOnceAndSaysHow) {
    if (::geteuid() != 0 || ::access(SETPRIV, X_OK) != 0) {
        GTEST_SKIP() << "needs root and setpriv, because the limit does not count for root";
    }
    ScriptedHttpServer server;
    server.setDefaultAnswer(TestSupport::resultAnswer("<variant confidence=\"0.9\">go</variant>"));
    // The limit counts the threads of a user, so each test has its own: they run side by side.
    std::vector<std::string> words = {
        "--reuid=" + std::to_string(54321 + GetParam()), "--regid=54321", "--clear-groups", PRLIMIT,
        "--nproc=" + std::to_string(GetParam()),         TALVOX_BINARY};
    const std::vector<std::string> arguments =
        recognize(server.getUrl(), {"--json", "--format", "speex"});
    words.insert(words.end(), arguments.begin(), arguments.end());
    ToolProcess tool(SETPRIV, words, voice());
    const ToolResult result = tool.wait();
    SCOPED_TRACE(result.out + result.err);
    if (result.err.find("Permission denied") != std::string::npos) {
        GTEST_SKIP() << "the tool lies where another user cannot reach it";
    }
    EXPECT_EQ(countEnds(result.out), 1u);
    // The main thread, one that waits for signals, and then the engine's: worker, events, network.
    if (GetParam() >= 5) {
        EXPECT_EQ(result.status, OK);
    } else {
        EXPECT_EQ(result.status, ENDED_IN_ERROR);
        EXPECT_THAT(result.err, HasSubstr(GetParam() < 4 ? "recognition ended with ErrorUnknown: "
                                                           "the system has no thread for the engine"
                                                         : "recognition ended with ErrorNetwork: "
                                                           "the network thread does not run"));
    }
}

INSTANTIATE_TEST_SUITE_P(Limits, ToolThreadsTest, ::testing::Values(2, 3, 4, 5, 8));

}  // namespace
