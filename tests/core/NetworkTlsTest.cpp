#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <memory>

#include "NetworkFixture.h"
#include "support/ChildProcess.h"
#include "support/LogCapture.h"
#include "support/TlsRelay.h"
#include "support/TlsServer.h"

using Network::NetworkManager;
using TestSupport::Answer;
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
    const TestSupport::LogCapture log;
    EXPECT_EQ("finished 200", fetch("localhost"));
    EXPECT_FALSE(log.containsPart("cannot be read"));
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
    const TestSupport::LogCapture log;
    NetworkManager::getInstance().setCertificateFile(path("missing.pem"));
    EXPECT_EQ("finished -1", fetch("localhost"));
    EXPECT_TRUE(log.contains("Network: the certificate file " + path("missing.pem") +
                             " cannot be read: No such file or directory"));
}

TEST_F(NetworkTlsTest, FailsWithAFileThatIsAPipe) {
    ASSERT_EQ(0, ::mkfifo(path("pipe").c_str(), 0600));
    const TestSupport::LogCapture log;
    NetworkManager::getInstance().setCertificateFile(path("pipe"));
    EXPECT_EQ("finished -1", fetch("localhost"));
    EXPECT_TRUE(log.contains("Network: the certificate file " + path("pipe") +
                             " cannot be read: it is no regular file"));
}

// A handle of libcurl's serves one request after the other.
TEST_F(NetworkTlsTest, ForgetsTheFileOfARequestThatEndsAfterItsReplacement) {
    server.script({Answer::status(200).held()});
    NetworkManager::getInstance().setCertificateFile(path("server.pem"));
    const auto slow = makeTask(server.getUrl());
    Network::NetworkTaskHolder slowHolder;
    slowHolder.submitNoRetries(slow);
    ASSERT_TRUE(server.waitForRequest(1));
    NetworkManager::getInstance().setCertificateFile("");
    EXPECT_EQ("finished -1", fetch("localhost"));
    server.release();
    EXPECT_EQ("finished 200", slow->waitForEnd());
    EXPECT_EQ("finished -1", fetch("localhost"));
}

TEST_F(NetworkTlsTest, DoesNotUseAConnectionThatTheFormerFileVouchedFor) {
    if (!TestSupport::TlsRelay::isAvailable()) {
        GTEST_SKIP() << "socat is not installed";
    }
    server.setDefaultAnswer(Answer::status(200));
    makeCertificate("relay", "IP:127.0.0.1");
    const TestSupport::TlsRelay relay(path("relay"), server.getPort());
    const auto fetchRelayed = [this, &relay] {
        const auto task = makeTask(relay.getUrl());
        holder.submitNoRetries(task);
        return task->waitForEnd();
    };
    NetworkManager::getInstance().setCertificateFile(path("relay.pem"));
    EXPECT_EQ("finished 200", fetchRelayed());
    EXPECT_EQ("finished 200", fetchRelayed());
    EXPECT_EQ(1U, server.getConnectionCount());
    NetworkManager::getInstance().setCertificateFile("");
    EXPECT_EQ("finished -1", fetchRelayed());
    EXPECT_EQ(2U, server.getRequestCount());
}

}  // namespace
