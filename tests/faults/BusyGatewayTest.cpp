// The real gateway while two clients that stall in mid-utterance hold all of its decoders.
#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <optional>
#include <thread>

#include "RecordedSession.h"
#include "gateway/Bodies.h"
#include "gateway/HttpClient.h"
#include "gateway/Server.h"
#include "pal/kd.h"

namespace FaultTest {

namespace {

constexpr std::size_t DECODERS = 2;

/** A gateway that refuses as soon as it finds no free decoder, with both of them taken. */
class FullGateway {
  public:
    FullGateway(const TestSupport::Samples& sound, const TestSupport::LogCapture& log)
        : server(makeOptions()) {
        EXPECT_EQ("", server.start());
        const std::vector<unsigned char> bytes = TestSupport::toBytes(sound, 0, sound.size());
        const std::string body = GatewayTest::parts(GatewayTest::usualFields()) +
                                 GatewayTest::part("audio", std::string(bytes.begin(), bytes.end()),
                                                   GatewayTest::PCM16K);
        for (std::size_t i = 1; i <= DECODERS; ++i) {
            stalled.push_back(std::make_unique<GatewayTest::HttpClient>(server.getPort()));
            stalled.back()->send(GatewayTest::requestHead("/asrgw_chunked?uuid=u1"));
            stalled.back()->sendChunk(body);
            // The log names the last byte on its own, once all before it has been decoded.
            stalled.back()->sendChunk("-");
            awaitLine(log, "sends 1 bytes", i);
        }
        EXPECT_FALSE(server.getPool().tryAcquire());
    }

    std::string getUrl() const { return server.getUrl(); }

    /** One of the stalled clients goes away. */
    void freeOneDecoder() {
        stalled.pop_back();
        while (!server.getPool().tryAcquire()) {
            std::this_thread::yield();
        }
    }

  private:
    /** Decoding may take a busy machine longer than the log's own patience. */
    static void awaitLine(const TestSupport::LogCapture& log, const std::string& part,
                          std::size_t times) {
        bool found = false;
        for (int i = 0; i < 6 && !found; ++i) {
            found = log.waitForPart(part, times);
        }
        EXPECT_TRUE(found) << part;
    }

    static Gateway::ServerOptions makeOptions() {
        Gateway::ServerOptions options;
        options.port = 0;
        options.decoders = DECODERS;
        options.decoderWaitMs = 0;
        options.verbose = true;
        return options;
    }

    Gateway::Server server;
    std::vector<std::unique_ptr<GatewayTest::HttpClient>> stalled;
};

class BusyGateway : public RecordedSession, public ::testing::WithParamInterface<bool> {
  protected:
    void SetUp() override {
        if (sound.empty()) {
            GTEST_SKIP() << "needs the package pocketsphinx-testdata";
        }
        setChunked(GetParam());
        gateway.emplace(sound, *log);
    }

    void TearDown() override {
        session.reset();
        kdDrainEventsKOR();
        gateway.reset();
        RecordedSession::TearDown();
    }

    /** Says everything, and waits until the gateway has refused the first attempt. */
    void speak() {
        startSession(gateway->getUrl());
        playTo(sound.size());
        session->stop();
        ASSERT_TRUE(log->waitForPart("refused: \"all decoders are busy\""));
        ASSERT_EQ(1U, countAnswers("503"));
        ASSERT_EQ(0U, events->countEnds());
    }

    /** Lets time pass until the session tries again, then waits for its end. */
    void awaitEndOfSecondAttempt() {
        const std::size_t expected = DECODERS + 2;
        // Not beyond the 20 s that an answer may take.
        for (int i = 0; i < 150 && countLines(" begins") < expected; ++i) {
            events->waitForEnds(1, std::chrono::milliseconds(20));
            advanceMs(BUFFER_MS);
        }
        ASSERT_TRUE(log->waitForPart(" begins", expected));
        ASSERT_TRUE(events->waitForEnds(1, std::chrono::seconds(60)));
    }

    /** Requests that the gateway has answered with this status. */
    std::size_t countAnswers(const std::string& status) const {
        return countLines(" " + status + " uuid=");
    }

    /** Lines of the gateway's log that hold this. */
    std::size_t countLines(const std::string& part) const {
        const std::vector<std::string> messages = log->messages();
        return static_cast<std::size_t>(
            std::count_if(messages.begin(), messages.end(), [&part](const std::string& message) {
                return message.find("POST /asrgw") == 0 && message.find(part) != std::string::npos;
            }));
    }

    std::optional<FullGateway> gateway;
};

TEST_P(BusyGateway, EndsASessionWithOneErrorAfterTheSecondAttempt) {
    speak();
    awaitEndOfSecondAttempt();
    ASSERT_EQ(1U, events->countEnds());
    EXPECT_EQ("error ErrorNetwork", events->texts().back());
    EXPECT_EQ(2U, countAnswers("503"));
    EXPECT_FALSE(log->contains("Recognition request timeout"));
    advanceMs(60000);
    kdDrainEventsKOR();
    EXPECT_EQ(1U, events->countEnds());
    EXPECT_EQ(2U, countAnswers("503"));
}

TEST_P(BusyGateway, ServesTheSecondAttemptOnceADecoderIsFree) {
    speak();
    gateway->freeOneDecoder();
    awaitEndOfSecondAttempt();
    ASSERT_EQ(1U, events->countEnds());
    ASSERT_EQ("results", events->texts().back());
    ASSERT_FALSE(events->recognition()->getResults()->empty());
    EXPECT_EQ(RECORDED_WORDS, events->recognition()->getResults()->front().getText());
    EXPECT_EQ(1U, countAnswers("503"));
    EXPECT_EQ(1U, countAnswers("200"));
}

INSTANTIATE_TEST_SUITE_P(Modes, BusyGateway, ::testing::Bool(),
                         [](const ::testing::TestParamInfo<bool>& parameters) {
                             return parameters.param ? "chunked" : "simple";
                         });

}  // namespace

}  // namespace FaultTest
