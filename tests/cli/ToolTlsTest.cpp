// The tool against servers whose certificate no authority of the system has signed.
#include <gmock/gmock.h>

#include "RecognizeRun.h"
#include "ToolProcess.h"
#include "support/ScratchDirectory.h"
#include "support/ScriptedHttpServer.h"
#include "support/TlsRelay.h"

namespace {

using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::StartsWith;
using TestSupport::recognize;
using TestSupport::resultAnswer;
using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;
using TestSupport::ScriptedHttpServer;
using TestSupport::TlsRelay;
using TestSupport::ToolResult;
using TestSupport::voice;

class ToolTls : public ::testing::Test {
  protected:
    void SetUp() override {
        if (!TlsRelay::isAvailable()) {
            GTEST_SKIP() << "openssl and socat are not installed";
        }
        for (const char* const name : {"server", "other"}) {
            ASSERT_EQ("", TestSupport::makeCertificate(directory.path(name), "IP:127.0.0.1"));
        }
    }

    /** The end of `talvox log`, which tries for as long as `timeout` says. */
    ToolResult log(const TlsRelay& relay, const std::string& timeout,
                   const std::vector<std::string>& more) const {
        std::vector<std::string> arguments = {"log", "--url",     relay.getUrl(), "--session",
                                              "s",   "--timeout", timeout,        "n"};
        arguments.insert(arguments.end(), more.begin(), more.end());
        return runTalvox(arguments);
    }

    const ScratchDirectory directory;
};

TEST_F(ToolTls, LogTrustsTheAuthoritiesOfTheFile) {
    ScriptedHttpServer server;
    const TlsRelay relay(directory.path("server"), server.getPort());
    const ToolResult trusted = log(relay, "10", {"--ca-file", directory.path("server.pem")});
    EXPECT_EQ(0, trusted.status) << trusted.err;
    EXPECT_EQ(1U, server.getRequestCount());
    const std::vector<std::string> others[] = {{}, {"--ca-file", directory.path("other.pem")}};
    for (const std::vector<std::string>& options : others) {
        const ToolResult refused = log(relay, "2", options);
        EXPECT_EQ(1, refused.status);
        EXPECT_THAT(refused.err, HasSubstr("talvox: Network: a request failed: SSL certificate"));
        EXPECT_THAT(refused.err, EndsWith("talvox: 1 record is not delivered\n"));
    }
    EXPECT_EQ(1U, server.getRequestCount());
}

TEST_F(ToolTls, RecognizeTrustsTheAuthoritiesOfTheFile) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(resultAnswer("<variant confidence=\"1\">a</variant>"));
    const TlsRelay relay(directory.path("server"), server.getPort());
    const ToolResult trusted =
        runTalvox(recognize(relay.getUrl(), {"--ca-file", directory.path("server.pem")}), voice());
    EXPECT_EQ(0, trusted.status) << trusted.err;
    EXPECT_THAT(trusted.out, HasSubstr("  1  a "));
    EXPECT_EQ(1U, server.getRequestCount());
    const std::vector<std::string> others[] = {{}, {"--ca-file", directory.path("other.pem")}};
    for (const std::vector<std::string>& options : others) {
        const ToolResult refused = runTalvox(recognize(relay.getUrl(), options), voice());
        EXPECT_EQ(1, refused.status);
        EXPECT_THAT(refused.err, StartsWith("talvox: recognition ended with ErrorNetwork: SSL "
                                            "certificate problem: "));
    }
    EXPECT_EQ(1U, server.getRequestCount());
}

}  // namespace
