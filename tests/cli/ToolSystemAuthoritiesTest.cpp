// The tool where the folder of the system's authorities is one of the test's.
#include <gmock/gmock.h>

#include <filesystem>

#include "DoctorRun.h"
#include "RecognizeRun.h"
#include "ToolProcess.h"
#include "support/ChildProcess.h"
#include "support/ScratchDirectory.h"
#include "support/ScriptedHttpServer.h"
#include "support/TlsRelay.h"
#include "support/TlsServer.h"

namespace {

using ::testing::StartsWith;
using TestSupport::DoctorResult;
using TestSupport::recognize;
using TestSupport::resultAnswer;
using TestSupport::ScriptedHttpServer;
using TestSupport::TlsRelay;
using TestSupport::ToolProcess;
using TestSupport::ToolResult;
using TestSupport::voice;
using Words = std::vector<std::string>;

const char* const UNSHARE = "/usr/bin/unshare";

class ToolSystemAuthorities : public ::testing::Test {
  protected:
    void SetUp() override {
        if (!TlsRelay::isAvailable()) {
            GTEST_SKIP() << "openssl and socat are not installed";
        }
        for (const char* const authority : {"system", "private", "other"}) {
            makeAuthority(authority);
            ASSERT_EQ("", TestSupport::makeSignedCertificate(
                              directory.path(std::string(authority) + "-server"),
                              directory.path(authority), "IP:127.0.0.1", 90));
        }
        std::filesystem::create_directory(directory.path("certs"));
        for (const char* const file : {"certs/a.pem", "certs/ca-certificates.crt"}) {
            std::filesystem::copy_file(directory.path("system.pem"), directory.path(file));
        }
        ASSERT_EQ(0, TestSupport::ChildProcess::run({"openssl", "rehash", directory.path("certs")})
                         .exitStatus);
        Words probe = launcher();
        probe.emplace_back("true");
        const auto result = TestSupport::ChildProcess::run(probe);
        if (result.exitStatus != 0) {
            GTEST_SKIP() << "a process cannot have mounts of its own: " << result.output;
        }
    }

    /** With a name of its own: OpenSSL does not look for a second authority of the same name. */
    void makeAuthority(const std::string& name) const {
        const auto made = TestSupport::ChildProcess::run(
            {"openssl", "req", "-x509", "-newkey", "ec", "-pkeyopt", "ec_paramgen_curve:prime256v1",
             "-nodes", "-days", "90", "-subj", "/CN=" + name, "-keyout",
             directory.path(name + ".key"), "-out", directory.path(name + ".pem")});
        ASSERT_EQ(0, made.exitStatus) << made.output;
    }

    /** Runs a command where the folder of the system's authorities is that of the test. */
    Words launcher() const {
        const std::string mount = "mount --bind " + directory.path("certs") + " /etc/ssl/certs";
        return {UNSHARE,
                "--user",
                "--map-root-user",
                "--mount",
                "sh",
                "-c",
                mount + " && exec \"$0\" \"$@\""};
    }

    /** Recognises at a server that this authority vouches for. */
    ToolResult run(const std::string& authority, const Words& options) const {
        ScriptedHttpServer server;
        server.setDefaultAnswer(resultAnswer("<variant confidence=\"1\">a</variant>"));
        const TlsRelay relay(directory.path(authority + "-server"), server.getPort());
        Words words = launcher();
        words.erase(words.begin());
        words.emplace_back(TALVOX_BINARY);
        const Words command = recognize(relay.getUrl(), options);
        words.insert(words.end(), command.begin(), command.end());
        ToolProcess tool(UNSHARE, words, voice());
        return tool.wait();
    }

    /** Examines a server that this authority vouches for. */
    DoctorResult examine(const std::string& authority) const {
        ScriptedHttpServer server;
        const TlsRelay relay(directory.path(authority + "-server"), server.getPort());
        Words words = launcher();
        words.insert(words.end(),
                     {TALVOX_BINARY, "doctor", relay.getUrl(), "--json", "--ca-file",
                      directory.path("private.pem"), "--idle", "0", "--timeout", "20"});
        DoctorResult result;
        result.output = TestSupport::ChildProcess::run(words).output;
        EXPECT_TRUE(result.report().is_object()) << result.output;
        return result;
    }

    void expectSuccess(const std::string& authority, const Words& options) const {
        const ToolResult result = run(authority, options);
        EXPECT_EQ(0, result.status) << authority << ": " << result.err;
    }

    void expectRefusal(const std::string& authority, const Words& options) const {
        const ToolResult result = run(authority, options);
        EXPECT_EQ(1, result.status) << authority;
        EXPECT_THAT(result.err, StartsWith("talvox: recognition ended with ErrorNetwork: SSL "
                                           "certificate problem: "));
    }

    const TestSupport::ScratchDirectory directory;
};

TEST_F(ToolSystemAuthorities, AreTrusted) {
    expectSuccess("system", {});
    expectRefusal("private", {});
}

TEST_F(ToolSystemAuthorities, AreTrustedBesideThoseOfTheFile) {
    const Words options = {"--ca-file", directory.path("private.pem")};
    expectSuccess("private", options);
    expectSuccess("system", options);
    expectRefusal("other", options);
}

TEST_F(ToolSystemAuthorities, AreTrustedByTheDoctorBesideThoseOfTheFile) {
    EXPECT_EQ("well", examine("private").verdict("tls"));
    EXPECT_EQ("well", examine("system").verdict("tls"));
    EXPECT_EQ("problem", examine("other").verdict("tls"));
}

}  // namespace
