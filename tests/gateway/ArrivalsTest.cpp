// When a body arrived: what is counted, and what the server reports of it.
#include "gateway/Arrivals.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <future>
#include <thread>

#include "core/util/Time.h"
#include "gateway/Bodies.h"
#include "gateway/HttpClient.h"
#include "gateway/RecordedSpeech.h"
#include "gateway/Server.h"
#include "support/LogCapture.h"

namespace {

using namespace GatewayTest;
using Gateway::Arrivals;
using TestSupport::LogCapture;
using Util::NS_PER_MS;

constexpr const char* STREAMED = "/asrgw_chunked?uuid=u1";

TEST(Arrivals, CountTimesFromTheHeadAndTheAnswerFromTheLastPiece) {
    Arrivals arrivals(1000 * NS_PER_MS);
    arrivals.add(1001 * NS_PER_MS);
    arrivals.add(1301 * NS_PER_MS);
    arrivals.add(1402 * NS_PER_MS);
    EXPECT_EQ("pieces=3 first=1ms last=402ms gap=300ms", arrivals.describe());
    arrivals.answer(1545 * NS_PER_MS);
    EXPECT_EQ("pieces=3 first=1ms last=402ms gap=300ms answer=143ms", arrivals.describe());
}

TEST(Arrivals, LeaveOutWhatHasNotHappened) {
    Arrivals none(5 * NS_PER_MS);
    EXPECT_EQ("pieces=0", none.describe());
    none.answer(12 * NS_PER_MS);
    EXPECT_EQ("pieces=0 answer=7ms", none.describe());
    Arrivals one(0);
    one.add(9 * NS_PER_MS);
    EXPECT_EQ("pieces=1 first=9ms last=9ms", one.describe());
}

/** A gateway whose clock is moved by hand, so that every figure is exact. */
class ArrivalReport : public ::testing::Test {
  protected:
    ArrivalReport() : server(makeOptions()) {
        kdUseManualClockKOR(NS_PER_MS);
        EXPECT_EQ("", server.start());
    }
    ~ArrivalReport() override { kdUseRealClockKOR(); }

    static Gateway::ServerOptions makeOptions() {
        Gateway::ServerOptions options;
        options.port = 0;
        options.decoders = 1;
        options.decoderWaitMs = 60000;
        options.verbose = true;
        return options;
    }

    /** Sends a piece of a streamed body and waits until the gateway has it. */
    void sendPiece(HttpClient& client, const std::string& piece) {
        client.sendChunk(piece);
        ++sent;
        ASSERT_TRUE(log.waitForPart("... sends ", sent));
    }

    static void pass(int ms) { kdAdvanceClockKOR(ms * NS_PER_MS); }

    /** The head of a streamed request with another header. */
    static std::string head(const std::string& header) {
        std::string text = requestHead(STREAMED);
        return text.insert(text.size() - 2, header);
    }

    /** Streams a body without sound in three pieces; 100 ms and 400 ms lie between them. */
    HttpAnswer streamSlowly(HttpClient& client, const std::string& header) {
        const std::string content = parts(usualFields()) + closing();
        client.send(head(header));
        EXPECT_TRUE(log.waitForPart("... begins"));
        pass(20);
        sendPiece(client, content.substr(0, 10));
        pass(100);
        sendPiece(client, content.substr(10, 100));
        pass(400);
        sendPiece(client, content.substr(110));
        client.sendChunk("");
        return client.read();
    }

    LogCapture log;
    Gateway::Server server;
    std::size_t sent = 0;
};

TEST_F(ArrivalReport, StandsInTheAnswerOfARequestThatAsksForIt) {
    HttpClient client(server.getPort());
    const HttpAnswer answer = streamSlowly(client, "X-Asrgw-Arrivals: report\r\n");
    EXPECT_EQ(200, answer.status);
    ASSERT_EQ(1U, answer.headers.count("x-asrgw-arrivals"));
    EXPECT_EQ("pieces=3 first=20ms last=520ms gap=400ms answer=0ms",
              answer.headers.at("x-asrgw-arrivals"));
}

TEST_F(ArrivalReport, StandsInTheLogOfEveryRequestAndInNoOtherAnswer) {
    HttpClient client(server.getPort());
    const HttpAnswer answer = streamSlowly(client, "");
    EXPECT_EQ(200, answer.status);
    EXPECT_EQ(0U, answer.headers.count("x-asrgw-arrivals"));
    EXPECT_TRUE(
        log.waitForPart(" decode=0ms pieces=3 first=20ms last=520ms gap=400ms answer=0ms "
                        "request=" +
                        answer.headers.at("x-kvrequestid")));
}

TEST_F(ArrivalReport, StandsInARefusalAsWell) {
    HttpClient client(server.getPort());
    client.send(head("x-asrgw-arrivals: 1\r\n"));
    sendPiece(client, "nonsense");
    client.sendChunk("");
    const HttpAnswer answer = client.read();
    EXPECT_EQ(400, answer.status);
    EXPECT_EQ("pieces=1 first=0ms last=0ms answer=0ms", answer.headers.at("x-asrgw-arrivals"));
}

TEST_F(ArrivalReport, CountsTheWaitForADecoder) {
    Gateway::DecoderPool::Lease busy = server.getPool().tryAcquire();
    ASSERT_TRUE(busy);
    HttpClient client(server.getPort());
    client.send(head("x-asrgw-arrivals: 1\r\n"));
    sendPiece(client, bodyWithSound(toPcm(readRecording("goforward.raw")), PCM16K));
    client.sendChunk("");
    while (server.getPool().getWaiting() == 0) {
        std::this_thread::yield();
    }
    pass(700);
    busy.reset();
    const HttpAnswer answer = client.read();
    EXPECT_EQ(200, answer.status);
    // One read may not return all of so long a chunk.
    EXPECT_THAT(answer.headers.at("x-asrgw-arrivals"), ::testing::EndsWith(" answer=700ms"));
}

TEST_F(ArrivalReport, HasNoAnswerOfAClientThatWentAway) {
    HttpClient client(server.getPort());
    client.send(head(""));
    sendPiece(client, parts(usualFields()));
    client.reset();
    ASSERT_TRUE(log.waitForPart(" went away: "));
    EXPECT_TRUE(log.containsPart(" pieces=1 first=0ms last=0ms request="));
}

}  // namespace
