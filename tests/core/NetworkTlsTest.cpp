#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <memory>

#include "NetworkFixture.h"
#include "support/ChildProcess.h"
#include "support/TlsRelay.h"
#include "support/TlsServer.h"

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
        makeCertificate("server", "DNS:localhost");
        tls = std::make_unique<TestSupport::TlsServer>(path("server"));
    }

    void TearDown() override {
        if (folder.empty()) {
            return;
        }
        NetworkManager::getInstance().setCertificateFile("");
        std::filesystem::remove_all(folder);
    }

    std::string path(const std::string& name) const { return folder + "/" + name; }

    void makeCertificate(const std::string& name, const std::string& subject) const {
        ASSERT_EQ("", TestSupport::makeCertificate(path(name), subject));
    }

    /** Makes `name` the certificate of this file. */
    void putCertificate(const std::string& name, const std::string& file) const {
        std::filesystem::copy_file(path(name), path(file),
                                   std::filesystem::copy_options::overwrite_existing);
    }

    std::string fetch(const std::string& host) {
        const auto task = makeTask(tls->getUrl(host));
        holder.submitNoRetries(task);
        return task->waitForEnd();
    }

    std::string folder;
    std::unique_ptr<TestSupport::TlsServer> tls;
};

TEST_F(NetworkTlsTest, RefusesACertificateThatNobodyVouchesFor) {
    EXPECT_EQ("finished -1", fetch("localhost"));
}

TEST_F(NetworkTlsTest, AcceptsTheCertificatesOfTheFileThatWasSet) {
    NetworkManager::getInstance().setCertificateFile(path("server.pem"));
    EXPECT_EQ("finished 200", fetch("localhost"));
}

TEST_F(NetworkTlsTest, ReturnsToTheAuthoritiesOfTheSystem) {
    NetworkManager::getInstance().setCertificateFile(path("server.pem"));
    NetworkManager::getInstance().setCertificateFile("");
    EXPECT_EQ("finished -1", fetch("localhost"));
}

TEST_F(NetworkTlsTest, RefusesACertificateOfAnotherAuthority) {
    makeCertificate("other", "DNS:localhost");
    NetworkManager::getInstance().setCertificateFile(path("other.pem"));
    EXPECT_EQ("finished -1", fetch("localhost"));
}

TEST_F(NetworkTlsTest, RefusesACertificateForAnotherHost) {
    NetworkManager::getInstance().setCertificateFile(path("server.pem"));
    EXPECT_EQ("finished -1", fetch("127.0.0.1"));
}

// What libcurl reads of a file is kept for a day, also when it is not all that the file holds.
TEST_F(NetworkTlsTest, ReadsTheAuthoritiesAgainAfterAConnectionThatTheyDidNotAllow) {
    makeCertificate("other", "DNS:localhost");
    putCertificate("other.pem", "authorities.pem");
    NetworkManager::getInstance().setCertificateFile(path("authorities.pem"));
    EXPECT_EQ("finished -1", fetch("localhost"));
    putCertificate("server.pem", "authorities.pem");
    EXPECT_EQ("finished 200", fetch("localhost"));
}

TEST_F(NetworkTlsTest, ReadsTheAuthoritiesOnceWhileTheyAllowEveryConnection) {
    putCertificate("server.pem", "authorities.pem");
    NetworkManager::getInstance().setCertificateFile(path("authorities.pem"));
    EXPECT_EQ("finished 200", fetch("localhost"));
    std::filesystem::remove(path("authorities.pem"));
    EXPECT_EQ("finished 200", fetch("localhost"));
}

TEST_F(NetworkTlsTest, TrustsNoAuthorityThatAnEarlierRequestTrusted) {
    server.script({TestSupport::Answer::status(200).held()});
    NetworkManager::getInstance().setCertificateFile(path("server.pem"));
    const auto early = makeTask(server.getUrl());
    holder.submitNoRetries(early);
    ASSERT_TRUE(server.waitForRequest(1));
    NetworkManager::getInstance().setCertificateFile("");
    Network::NetworkTaskHolder other;
    const auto late = makeTask(server.getUrl());
    other.submitNoRetries(late);
    EXPECT_EQ("finished 200", late->waitForEnd());
    // The handle of the early request comes back last, so it would serve the next one.
    server.release();
    EXPECT_EQ("finished 200", early->waitForEnd());
    settle();
    EXPECT_EQ("finished -1", fetch("localhost"));
    NetworkManager::getInstance().setCertificateFile(path("server.pem"));
    EXPECT_EQ("finished 200", fetch("localhost"));
    NetworkManager::getInstance().setCertificateFile("");
    EXPECT_EQ("finished -1", fetch("localhost"));
}

TEST_F(NetworkTlsTest, FailsWithoutTheFileThatWasSet) {
    NetworkManager::getInstance().setCertificateFile(path("missing.pem"));
    EXPECT_EQ("finished -1", fetch("localhost"));
}

}  // namespace
