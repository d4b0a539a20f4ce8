// samples/gateway, which is written from docs/PROTOCOL.md, serves the client.
#include <gmock/gmock.h>
#include <signal.h>

#include <boost/make_shared.hpp>
#include <future>
#include <memory>

#include "SessionTest.h"
#include "logcollector/LogCollector.h"
#include "support/ChildProcess.h"

namespace {

using Talvox::Settings;
using ::testing::HasSubstr;
using TestSupport::ChildProcess;

const std::string ANNOUNCEMENT = "listening on ";
const std::string TEXT = "rock & roll";

/** The program, on a port of its own. */
class SampleGateway {
  public:
    SampleGateway() : process({"python3", SAMPLE_GATEWAY, "--port", "0", "--text", TEXT}) {
        for (std::string piece = process.read(); !piece.empty(); piece = process.read()) {
            output += piece;
            const std::size_t begin = output.find(ANNOUNCEMENT);
            const std::size_t end = output.find('\n', begin);
            if (begin != std::string::npos && end != std::string::npos) {
                url = output.substr(begin + ANNOUNCEMENT.size(), end - begin - ANNOUNCEMENT.size());
                return;
            }
        }
    }

    const std::string& getUrl() const { return url; }

    /** Ends the program. @return what it has printed */
    std::string finish() {
        process.sendSignal(SIGTERM);
        for (std::string piece = process.read(); !piece.empty(); piece = process.read()) {
            output += piece;
        }
        return output;
    }

  private:
    ChildProcess process;
    std::string output;
    std::string url;
};

class SampleGatewayTest : public CloudTest::SessionTest {
  protected:
    void SetUp() override {
        if (!ChildProcess::isInstalled("python3")) {
            GTEST_SKIP() << "no python3";
        }
        gateway = std::make_unique<SampleGateway>();
        ASSERT_THAT(gateway->getUrl(), HasSubstr("http://127.0.0.1:"));
    }

    void recognise(bool streamed, const std::string& format) {
        configure([&](Settings& settings) {
            settings.putString(Settings::SKS_URL, gateway->getUrl());
            settings.putBoolean(Settings::SKS_STREAMING, streamed);
            settings.putString(Settings::SKS_SOUND_FORMAT, format);
        });
        startSession();
        play(300);
        session->stop();
    }

    std::unique_ptr<SampleGateway> gateway;
};

TEST_F(SampleGatewayTest, AnswersInBothModesAndFormats) {
    for (const bool streamed : {false, true}) {
        for (const std::string& format :
             {Settings::SOUND_FORMAT_PCM, Settings::SOUND_FORMAT_SPEEX}) {
            recognise(streamed, format);
            ASSERT_TRUE(events->waitForEnds());
            ASSERT_EQ(events->texts().back(), "results") << events->errorReason();
            ASSERT_EQ(events->recognition()->getResults()->size(), 1U);
            EXPECT_EQ(events->recognition()->getResults()->at(0).getText(), TEXT);
            EXPECT_EQ(events->recognition()->getRequestId().size(), 32U);
        }
    }
    const std::string fields = std::string(" uuid=") + CloudTest::UUID +
                               " lang=ru-RU topic=general myll=0.000000,0.000000"
                               " centerll=0.000000,0.000000 ";
    const std::string output = gateway->finish();
    for (const char* const path : {"/asrgw", "/asrgw_chunked"}) {
        EXPECT_THAT(output, HasSubstr(path + fields + "PCM 9600 bytes\n"));
        EXPECT_THAT(output, HasSubstr(path + fields + "Ogg Speex "));
    }
}

TEST_F(SampleGatewayTest, RefusesWhatIsNotARecognition) {
    configureText(Settings::SKS_URL, gateway->getUrl() + "/elsewhere");
    startSession();
    play(300);
    session->stop();
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts().back(), "error ErrorNetwork");
    EXPECT_EQ(events->errorReason(), "HTTP status 404");
}

TEST_F(SampleGatewayTest, TakesUsageRecords) {
    std::promise<void> delivered;
    LogCollector::setDeliveredCallback([&delivered] { delivered.set_value(); });
    LogCollector::configure(CloudTest::UUID, gateway->getUrl() + "/log");
    LogCollector::setLoggingEnabled(true);
    LogCollector::startSession("sample");
    LogCollector::logEvent("sample", "opened", {{"bytes", "+\xFF\n"}});
    LogCollector::setLoggingEnabled(false);
    EXPECT_EQ(delivered.get_future().wait_for(TestSupport::SERVER_WAIT_DFLT),
              std::future_status::ready);
    LogCollector::setDeliveredCallback({});
    EXPECT_THAT(gateway->finish(),
                HasSubstr("sessionId=sample;type=event;name=opened;bytes=+\\xff\\n\n"));
}

}  // namespace
