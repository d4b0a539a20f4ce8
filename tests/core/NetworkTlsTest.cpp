#include <unistd.h>

#include <cstdlib>
#include <memory>

#include "NetworkFixture.h"
#include "support/ChildProcess.h"
#include "support/TlsRelay.h"

using Network::NetworkManager;
using TestSupport::ChildProcess;

namespace {

/** A TLS server with a certificate of its own that no authority of the system has signed. */
class NetworkTlsTest : public NetworkFixture {
  protected:
    void SetUp() override {
        if (!ChildProcess::isInstalled("openssl")) {
            GTEST_SKIP() << "openssl is not installed";
        }
        char pattern[] = "/tmp/talvox-tls-XXXXXX";
        ASSERT_NE(nullptr, ::mkdtemp(pattern));
        folder = pattern;
        makeCertificate("server", "IP:127.0.0.1");
        startServer();
    }

    void TearDown() override {
        if (folder.empty()) {
            return;
        }
        NetworkManager::getInstance().setCertificateFile("");
        for (const char* const name : {"server.key", "server.pem", "other.key", "other.pem"}) {
            ::unlink(path(name).c_str());
        }
        ::rmdir(folder.c_str());
    }

    std::string path(const std::string& name) const { return folder + "/" + name; }

    void makeCertificate(const std::string& name, const std::string& subject) const {
        ASSERT_EQ("", TestSupport::makeCertificate(path(name), subject));
    }

    void startServer() {
        tls = std::make_unique<ChildProcess>(
            std::vector<std::string>{"openssl", "s_server", "-accept", "127.0.0.1:0", "-www",
                                     "-cert", path("server.pem"), "-key", path("server.key")});
        const std::string mark = "ACCEPT 127.0.0.1:";
        std::string output;
        std::size_t start = std::string::npos;
        while (start == std::string::npos || output.find('\n', start) == std::string::npos) {
            const std::string piece = tls->read();
            ASSERT_NE("", piece) << output;
            output += piece;
            start = output.find(mark);
        }
        port = std::atoi(output.c_str() + start + mark.size());
    }

    std::string fetch(const std::string& host) {
        const auto task = makeTask("https://" + host + ":" + std::to_string(port) + "/");
        holder.submitNoRetries(task);
        return task->waitForEnd();
    }

    std::string folder;
    std::unique_ptr<ChildProcess> tls;
    int port = 0;
};

TEST_F(NetworkTlsTest, RefusesACertificateThatNobodyVouchesFor) {
    EXPECT_EQ("finished -1", fetch("127.0.0.1"));
}

TEST_F(NetworkTlsTest, AcceptsTheCertificatesOfTheFileThatWasSet) {
    NetworkManager::getInstance().setCertificateFile(path("server.pem"));
    EXPECT_EQ("finished 200", fetch("127.0.0.1"));
}

TEST_F(NetworkTlsTest, ReturnsToTheAuthoritiesOfTheSystem) {
    NetworkManager::getInstance().setCertificateFile(path("server.pem"));
    NetworkManager::getInstance().setCertificateFile("");
    EXPECT_EQ("finished -1", fetch("127.0.0.1"));
}

TEST_F(NetworkTlsTest, RefusesACertificateOfAnotherAuthority) {
    makeCertificate("other", "IP:127.0.0.1");
    NetworkManager::getInstance().setCertificateFile(path("other.pem"));
    EXPECT_EQ("finished -1", fetch("127.0.0.1"));
}

TEST_F(NetworkTlsTest, RefusesACertificateForAnotherHost) {
    NetworkManager::getInstance().setCertificateFile(path("server.pem"));
    EXPECT_EQ("finished -1", fetch("localhost"));
}

TEST_F(NetworkTlsTest, FailsWithoutTheFileThatWasSet) {
    NetworkManager::getInstance().setCertificateFile(path("missing.pem"));
    EXPECT_EQ("finished -1", fetch("127.0.0.1"));
}

}  // namespace
