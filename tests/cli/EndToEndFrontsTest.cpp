// Real proxies in front of the gateway: what the default of nginx does to streaming, and that the
// files of docs/deploy work as documented.
#include <gmock/gmock.h>

#include <csignal>
#include <memory>
#include <sstream>
#include <thread>

#include "DoctorRun.h"
#include "Fronts.h"
#include "RecognizeRun.h"
#include "ToolProcess.h"
#include "support/ScriptedHttpServer.h"
#include "support/TlsRelay.h"
#include "support/TlsServer.h"

namespace {

using ::testing::HasSubstr;
using ::testing::MatchesRegex;
using ::testing::StartsWith;
using TestSupport::Answer;
using TestSupport::deployFile;
using TestSupport::DoctorResult;
using TestSupport::Haproxy;
using TestSupport::makeCertificate;
using TestSupport::makeSignedCertificate;
using TestSupport::Nginx;
using TestSupport::runDoctor;
using TestSupport::ScratchDirectory;
using TestSupport::ScriptedHttpServer;
using TestSupport::TlsRelay;
using TestSupport::ToolProcess;
using TestSupport::ToolResult;

const char* const RECORDING = "/usr/share/pocketsphinx/test/data/goforward.raw";

/** The real gateway as a process. */
class Gateway {
  public:
    Gateway() : program(GATEWAY_BINARY, {"--port", "0"}) {
        const std::string line = program.waitForLine("listening on");
        url = line.substr(line.rfind(' ') + 1);
    }
    std::string getPlace() const { return url.substr(url.rfind('/') + 1); }
    std::string getUrl() const { return url; }
    void kill() const { program.signal(SIGKILL); }

  private:
    ToolProcess program;
    std::string url;
};

/** An answer with results and a good report of arrivals. */
Answer goodAnswer(const std::string& results) {
    return Answer::raw(
        "HTTP/1.1 200 OK\r\nContent-Length: 0\r\nx-asrgw-recognition-results: " + results +
        "\r\nx-asrgw-arrivals: pieces=20 first=1ms last=1901ms gap=104ms "
        "answer=5ms\r\n\r\n");
}

class EndToEndFronts : public ::testing::TestWithParam<const char*> {
  protected:
    void SetUp() override {
        if (!Nginx::isInstalled() || !Haproxy::isInstalled() || !TlsRelay::isAvailable()) {
            GTEST_SKIP() << "needs nginx, haproxy, openssl and socat";
        }
        ASSERT_EQ("", makeCertificate(directory.path("authority"), "DNS:authority"));
        ASSERT_EQ("", makeSignedCertificate(directory.path("server"), directory.path("authority"),
                                            "IP:127.0.0.1", 90));
        directory.write("both.pem", ScratchDirectory::read(directory.path("server.pem")) +
                                        ScratchDirectory::read(directory.path("server.key")));
    }

    /** Starts the documented front that the file's name tells. @return its address */
    std::string startFront(const std::string& file, const std::vector<std::string>& gateways) {
        unsigned short port = 0;
        if (file.find("nginx") == 0) {
            std::string places;
            for (const std::string& gateway : gateways) {
                places += "server " + gateway + " max_fails=1 fail_timeout=5s;\n";
            }
            nginx = std::make_unique<Nginx>(deployFile(file),
                                            "ssl_certificate " + directory.path("server.pem") +
                                                ";\nssl_certificate_key " +
                                                directory.path("server.key") + ";\n",
                                            places);
            port = nginx->getPort();
        } else {
            haproxy =
                std::make_unique<Haproxy>(deployFile(file), directory.path("both.pem"), gateways);
            port = haproxy->getPort();
        }
        return "https://127.0.0.1:" + std::to_string(port);
    }

    std::string authority() const { return directory.path("authority.pem"); }

    const ScratchDirectory directory;
    std::unique_ptr<Nginx> nginx;
    std::unique_ptr<Haproxy> haproxy;
};

TEST_F(EndToEndFronts, NginxByDefaultCollectsTheRequestAndLimitsTheBody) {
    const Gateway gateway;
    const std::string file = directory.write(
        "default.conf", "server { include talvox/listen.conf; location / { proxy_pass " +
                            gateway.getUrl() + "; } }\n");
    const Nginx front(file, "keepalive_timeout 1s;\n", "");
    const DoctorResult result = runDoctor("http://127.0.0.1:" + std::to_string(front.getPort()),
                                          {"--timeout", "600", "--idle", "600"});
    EXPECT_EQ(1, result.status);
    EXPECT_EQ("well", result.verdict("whole")) << result.words("whole");
    EXPECT_EQ("problem", result.verdict("streamed"));
    EXPECT_THAT(result.words("streamed"),
                StartsWith("something between here and the gateway collects the request before it "
                           "passes it on: "));
    EXPECT_THAT(result.words("size"), StartsWith("limit of 1 MB for a body: status 413 for one of "
                                                 "1.69 MB, "));
    EXPECT_EQ(1048576, result.check("size")["limitBytes"]);
    EXPECT_THAT(result.words("kept"),
                MatchesRegex("kept connections are closed after [0-9.]+ s\n.*"));
}

TEST_F(EndToEndFronts, WithoutOneAllIsWell) {
    const Gateway gateway;
    const DoctorResult result = runDoctor(gateway.getUrl(), {"--timeout", "600", "--idle", "1"});
    EXPECT_EQ(0, result.status) << result.output;
}

TEST_P(EndToEndFronts, PassesThePiecesOnAsTheyCome) {
    const Gateway gateway;
    const bool isOne = std::string(GetParam()).find("-one") != std::string::npos;
    std::unique_ptr<Gateway> other = isOne ? nullptr : std::make_unique<Gateway>();
    std::vector<std::string> places = {gateway.getPlace()};
    if (other) {
        places.push_back(other->getPlace());
    }
    const std::string url = startFront(GetParam(), places);
    const DoctorResult result =
        runDoctor(url, {"--ca-file", authority(), "--timeout", "600", "--idle", "1"});
    EXPECT_EQ(0, result.status) << result.output;
    EXPECT_EQ("well", result.verdict("streamed")) << result.words("streamed");
    EXPECT_EQ("well", result.verdict("size")) << result.words("size");
}

TEST_P(EndToEndFronts, PassesLongResultsOn) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(goodAnswer(std::string(60000, 'A')));
    const std::string place = "127.0.0.1:" + std::to_string(server.getPort());
    const std::string url = startFront(GetParam(), {place, place});
    const DoctorResult result =
        runDoctor(url, {"--ca-file", authority(), "--timeout", "600", "--idle", "0"});
    EXPECT_EQ("well", result.verdict("whole")) << result.words("whole");
}

INSTANTIATE_TEST_SUITE_P(Documented, EndToEndFronts,
                         ::testing::Values("nginx-one.conf", "nginx-many.conf", "haproxy-one.cfg",
                                           "haproxy-many.cfg"),
                         [](const auto& file) {
                             std::string name = file.param;
                             name = name.substr(0, name.find('.'));
                             name[name.find('-')] = '_';
                             return name;
                         });

/** The gateway that has a session at the moment, as haproxy counts; empty for none. */
std::string findBusy(const Haproxy& front) {
    std::istringstream lines(front.command("show stat"));
    for (std::string line; std::getline(lines, line);) {
        std::istringstream fields(line);
        std::vector<std::string> values;
        for (std::string field; std::getline(fields, field, ',') && values.size() < 5;) {
            values.push_back(field);
        }
        const bool isServer =
            values.size() == 5 && values[0] == "gateways" && values[1] != "BACKEND";
        if (isServer && values[4] != "0") {
            return values[1];
        }
    }
    return "";
}

TEST_F(EndToEndFronts, TheWordsArriveWhenOneOfTwoGatewaysIsKilledInMidSession) {
    if (ScratchDirectory::read(RECORDING).empty()) {
        GTEST_SKIP() << "needs the package pocketsphinx-testdata";
    }
    const Gateway one;
    const Gateway two;
    const std::string url = startFront("haproxy-many.cfg", {one.getPlace(), two.getPlace()});
    ToolProcess session(TALVOX_BINARY,
                        {"recognize", "--json", "--file", "-", "--rate", "16000", "--url", url,
                         "--ca-file", authority(), "--streaming", "--format", "pcm"},
                        ScratchDirectory::read(RECORDING));
    ASSERT_NE("", session.waitForLine("speakingBegin"));
    const std::string busy = findBusy(*haproxy);
    ASSERT_THAT(busy, ::testing::AnyOf("one", "two"));
    (busy == "one" ? one : two).kill();
    const ToolResult result = session.wait();
    EXPECT_EQ(0, result.status) << result.err;
    EXPECT_THAT(result.out, HasSubstr("go forward ten meters"));
}

TEST_F(EndToEndFronts, AGatewayThatIsDrainedGetsNoMoreRequests) {
    ScriptedHttpServer one;
    ScriptedHttpServer two;
    std::vector<std::string> places;
    for (ScriptedHttpServer* const server : {&one, &two}) {
        server->setDefaultAnswer(goodAnswer("YQ=="));
        places.push_back("127.0.0.1:" + std::to_string(server->getPort()));
    }
    const std::string url = startFront("haproxy-many.cfg", places);
    // Its answer comes after it has begun to serve.
    ASSERT_TRUE(two.waitForRequest(1));
    EXPECT_EQ("\n", haproxy->command("set server gateways/one state drain"));
    const DoctorResult result = runDoctor(url, {"--ca-file", authority(), "--idle", "0"});
    EXPECT_EQ(0, result.status) << result.output;
    std::size_t posts[] = {0, 0};
    const ScriptedHttpServer* const servers[] = {&one, &two};
    for (const std::size_t i : {0U, 1U}) {
        for (std::size_t k = 0; k < servers[i]->getRequestCount(); ++k) {
            posts[i] += servers[i]->getRequest(k).line().find("POST") == 0 ? 1 : 0;
        }
    }
    EXPECT_EQ(0U, posts[0]);
    EXPECT_EQ(5U, posts[1]);
}

}  // namespace
