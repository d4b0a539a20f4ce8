/**
 * @file
 * HTTPS as on a device: libcurl and TLS library in the configuration of the Android library, and
 * the platform's two folders of authorities.
 */
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>

#include "core/NetworkFixture.h"
#include "support/LogCapture.h"
#include "support/ScratchDirectory.h"
#include "support/TlsRelay.h"
#include "support/TlsServer.h"

namespace {

using Network::NetworkManager;
using TestSupport::TlsServer;

constexpr const char* UPDATED = UPDATED_AUTHORITIES;
constexpr const char* SYSTEM = SYSTEM_AUTHORITIES;

/** An authority, and a server for "localhost" that it vouches for. */
class FolderAuthoritiesTest : public NetworkFixture {
  protected:
    void SetUp() override {
        empty(UPDATED);
        empty(SYSTEM);
        makeAuthority("authority");
        makeServer("server", "authority", "DNS:localhost", 2);
    }

    void TearDown() override {
        NetworkManager::getInstance().setCertificateFile("");
        empty(UPDATED);
        empty(SYSTEM);
    }

    static void empty(const std::string& folder) {
        std::filesystem::remove_all(folder);
        std::filesystem::create_directories(folder);
    }

    void makeAuthority(const std::string& name) const {
        ASSERT_EQ("", TestSupport::makeCertificate(scratch.path(name), "DNS:authority"));
    }

    void makeServer(const std::string& name, const std::string& authority,
                    const std::string& subject, int days) const {
        ASSERT_EQ("", TestSupport::makeSignedCertificate(scratch.path(name),
                                                         scratch.path(authority), subject, days));
    }

    /** In the platform's form: a hash as the name, the certificate, and a description behind it. */
    void install(const std::string& authority, const std::string& folder) const {
        std::ifstream certificate(scratch.path(authority + ".pem"));
        std::ofstream(folder + "/5ed36f99.0")
            << certificate.rdbuf() << "Certificate:\n    Data:\n        Version: 3 (0x2)\n";
    }

    std::string fetch(const std::string& name, const std::string& host = "localhost") {
        const TlsServer tls(scratch.path(name));
        const auto task = makeTask(tls.getUrl(host));
        holder.submitNoRetries(task);
        return task->waitForEnd();
    }

    const TestSupport::ScratchDirectory scratch;
};

TEST_F(FolderAuthoritiesTest, TrustsAnAuthorityInTheSystemsFolder) {
    install("authority", SYSTEM);
    EXPECT_EQ("finished 200", fetch("server"));
}

TEST_F(FolderAuthoritiesTest, TrustsAnAuthorityInTheUpdatedFolder) {
    install("authority", UPDATED);
    EXPECT_EQ("finished 200", fetch("server"));
}

TEST_F(FolderAuthoritiesTest, RefusesAnAuthorityThatIsInNoFolder) {
    makeAuthority("other");
    install("other", SYSTEM);
    EXPECT_EQ("finished -1", fetch("server"));
}

TEST_F(FolderAuthoritiesTest, RefusesAnAuthorityThatAnUpdateHasRemoved) {
    makeAuthority("other");
    install("authority", SYSTEM);
    install("other", UPDATED);
    EXPECT_EQ("finished -1", fetch("server"));
}

TEST_F(FolderAuthoritiesTest, RefusesAnExpiredCertificate) {
    install("authority", SYSTEM);
    makeServer("expired", "authority", "DNS:localhost", -1);
    EXPECT_EQ("finished -1", fetch("expired"));
}

TEST_F(FolderAuthoritiesTest, RefusesACertificateForAnotherHost) {
    install("authority", SYSTEM);
    makeServer("misnamed", "authority", "DNS:example.org", 2);
    EXPECT_EQ("finished -1", fetch("misnamed"));
}

// mbed TLS 2.28 does not compare addresses.
TEST_F(FolderAuthoritiesTest, RefusesAnAddressAlsoIfTheCertificateNamesIt) {
    install("authority", SYSTEM);
    makeServer("addressed", "authority", "DNS:localhost,IP:127.0.0.1", 2);
    EXPECT_EQ("finished 200", fetch("addressed"));
    EXPECT_EQ("finished -1", fetch("addressed", "127.0.0.1"));
}

TEST_F(FolderAuthoritiesTest, RefusesEveryCertificateWhileThereIsNoAuthority) {
    const TestSupport::LogCapture log;
    EXPECT_EQ("finished -1", fetch("server"));
    EXPECT_TRUE(log.contains("Network: the platform has no certificates of authorities"));
}

TEST_F(FolderAuthoritiesTest, ReadsTheFolderAgainWhileItFoundNothing) {
    EXPECT_EQ("finished -1", fetch("server"));
    install("authority", SYSTEM);
    EXPECT_EQ("finished 200", fetch("server"));
}

TEST_F(FolderAuthoritiesTest, ReadsTheFolderOnceForAllConnections) {
    install("authority", SYSTEM);
    EXPECT_EQ("finished 200", fetch("server"));
    empty(SYSTEM);
    EXPECT_EQ("finished 200", fetch("server"));
    EXPECT_EQ("finished 200", fetch("server"));
}

TEST_F(FolderAuthoritiesTest, SkipsAFileThatIsNoCertificate) {
    install("authority", SYSTEM);
    std::ofstream(std::string(SYSTEM) + "/0a775a30.0") << "no certificate\n";
    const TestSupport::LogCapture log;
    EXPECT_EQ("finished 200", fetch("server"));
    EXPECT_TRUE(log.contains("Network: 1 files of " + std::string(SYSTEM) +
                             " are not readable as certificates"));
}

/** An authority of the application beside that of the platform. */
class PrivateAuthorityTest : public FolderAuthoritiesTest {
  protected:
    void SetUp() override {
        FolderAuthoritiesTest::SetUp();
        install("authority", SYSTEM);
        makeAuthority("private");
        makeServer("internal", "private", "DNS:localhost", 2);
        NetworkManager::getInstance().setCertificateFile(scratch.path("private.pem"));
    }
};

TEST_F(PrivateAuthorityTest, IsTrustedBesideThePlatforms) {
    EXPECT_EQ("finished 200", fetch("internal"));
    EXPECT_EQ("finished 200", fetch("server"));
    EXPECT_EQ("finished 200", fetch("internal"));
}

TEST_F(PrivateAuthorityTest, IsTrustedWhereThePlatformHasNone) {
    empty(SYSTEM);
    EXPECT_EQ("finished 200", fetch("internal"));
    EXPECT_EQ("finished -1", fetch("server"));
    // Found with the next connection, as without a private authority.
    install("authority", SYSTEM);
    EXPECT_EQ("finished 200", fetch("server"));
    EXPECT_EQ("finished 200", fetch("internal"));
}

TEST_F(PrivateAuthorityTest, VouchesForNothingOutsideBoth) {
    makeAuthority("other");
    makeServer("foreign", "other", "DNS:localhost", 2);
    EXPECT_EQ("finished -1", fetch("foreign"));
}

TEST_F(PrivateAuthorityTest, DoesNotMakeAnExpiredCertificateGood) {
    makeServer("expired", "private", "DNS:localhost", -1);
    EXPECT_EQ("finished -1", fetch("expired"));
}

TEST_F(PrivateAuthorityTest, DoesNotMakeAnotherHostsCertificateGood) {
    makeServer("misnamed", "private", "DNS:example.org", 2);
    EXPECT_EQ("finished -1", fetch("misnamed"));
}

TEST_F(PrivateAuthorityTest, IsForgottenWithoutItsFile) {
    EXPECT_EQ("finished 200", fetch("internal"));
    NetworkManager::getInstance().setCertificateFile("");
    EXPECT_EQ("finished -1", fetch("internal"));
    EXPECT_EQ("finished 200", fetch("server"));
}

TEST_F(PrivateAuthorityTest, GivesWayToTheNextFile) {
    makeAuthority("second");
    makeServer("later", "second", "DNS:localhost", 2);
    EXPECT_EQ("finished 200", fetch("internal"));
    NetworkManager::getInstance().setCertificateFile(scratch.path("second.pem"));
    EXPECT_EQ("finished 200", fetch("later"));
    EXPECT_EQ("finished -1", fetch("internal"));
    EXPECT_EQ("finished 200", fetch("server"));
}

TEST_F(PrivateAuthorityTest, IsReadOnceLikeThePlatforms) {
    EXPECT_EQ("finished 200", fetch("internal"));
    std::filesystem::remove(scratch.path("private.pem"));
    empty(SYSTEM);
    EXPECT_EQ("finished 200", fetch("internal"));
    EXPECT_EQ("finished 200", fetch("server"));
}

TEST_F(PrivateAuthorityTest, IsReadAgainAfterARefusal) {
    makeAuthority("second");
    makeServer("later", "second", "DNS:localhost", 2);
    EXPECT_EQ("finished -1", fetch("later"));
    std::filesystem::copy_file(scratch.path("second.pem"), scratch.path("private.pem"),
                               std::filesystem::copy_options::overwrite_existing);
    EXPECT_EQ("finished 200", fetch("later"));
    EXPECT_EQ("finished 200", fetch("server"));
}

TEST_F(PrivateAuthorityTest, FailsAllConnectionsWhileItsFileIsMissing) {
    NetworkManager::getInstance().setCertificateFile(scratch.path("missing.pem"));
    EXPECT_EQ("finished -1", fetch("internal"));
    EXPECT_EQ("finished -1", fetch("server"));
}

TEST_F(PrivateAuthorityTest, FailsAllConnectionsWhileItsFileHoldsNoCertificate) {
    std::ofstream(scratch.path("private.pem")) << "no certificate\n";
    EXPECT_EQ("finished -1", fetch("internal"));
    EXPECT_EQ("finished -1", fetch("server"));
}

}  // namespace
