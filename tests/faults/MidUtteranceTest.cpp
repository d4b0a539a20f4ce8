#include <gtest/gtest.h>

#include "FaultSession.h"
#include "support/OggSpeexDecoder.h"
#include "talvox/Settings.h"

namespace FaultTest {

namespace {

using Talvox::Settings;
using TestSupport::Answer;

constexpr int64_t SPEECH_END_MS = 2900;
const std::string PART_END = "\r\n--1BEF0A57BE110FD467A--\r\n";

/** The bytes of the part that holds the sound, which is the last one. */
std::string takeSound(const std::string& body) {
    const std::size_t part = body.find("name=\"audio\"");
    const std::size_t begin = body.find("\r\n\r\n", part);
    const std::size_t end = body.size() - PART_END.size();
    if (part == std::string::npos || body.compare(end, std::string::npos, PART_END) != 0) {
        return std::string();
    }
    return body.substr(begin + 4, end - begin - 4);
}

/** A connection that is lost while the user speaks costs no word. */
class MidUtteranceTest : public FaultSession {
  protected:
    MidUtteranceTest() {
        setChunked(true);
        // Each session has a connection of its own; what differs on a kept one has its own test.
        server->setDefaultAnswer(CloudTest::answerGoForward().thenClose());
    }

    /** Resets the connection at a time of the session; the next one is welcome. */
    void cutAt(int64_t ms) {
        onStep = [this, ms] {
            if (elapsedMs() == ms) {
                server->dropConnections();
            }
        };
    }

    void expectWholeSound(const SessionOutcome& outcome) {
        EXPECT_EQ("results (go forward)", outcome.end);
        ASSERT_GE(server->getRequestCount(), 1U);
        const auto last = server->getRequest(server->getRequestCount() - 1);
        EXPECT_TRUE(last.complete);
        EXPECT_TRUE(soundUpTo(SPEECH_END_MS) == takeSound(last.body));
    }
};

TEST_F(MidUtteranceTest, AnUndisturbedRequestHoldsTheWholeSound) {
    const SessionOutcome outcome = run();
    EXPECT_EQ(SPEECH_END_MS, outcome.speechEndMs);
    EXPECT_EQ(1U, outcome.attempts);
    EXPECT_TRUE(soundUpTo(SPEECH_END_MS) == takeSound(server->getRequest(0).body));
}

TEST_F(MidUtteranceTest, LostBeforeTheFirstByteItIsSentFromTheFirstFrame) {
    server->resetConnections(1);
    expectWholeSound(run());
    EXPECT_EQ(1U, server->getRequestCount());
}

TEST_F(MidUtteranceTest, LostAtAnyTimeItIsSentAgainFromTheFirstFrame) {
    for (const int64_t ms : {100, 300, 700, 1000, 1500, 2000, 2500, 2800}) {
        SCOPED_TRACE(ms);
        cutAt(ms);
        const SessionOutcome outcome = run();
        expectWholeSound(outcome);
        EXPECT_EQ(2U, outcome.attempts);
        EXPECT_EQ(2U, outcome.requests);
        // Two seconds of pause, or the speech that goes on meanwhile.
        EXPECT_EQ(std::max(SPEECH_END_MS, ms + 2000), outcome.endMs);
        const auto first = server->getRequest(server->getRequestCount() - 2);
        EXPECT_FALSE(first.complete);
        EXPECT_NE(std::string::npos, first.body.find(soundUpTo(ms)));
    }
}

TEST_F(MidUtteranceTest, LostAfterAnyNumberOfBytesItIsSentAgainFromTheFirstFrame) {
    for (const std::size_t bytes : {0U, 1U, 300U, 700U, 5000U, 40000U, 90000U}) {
        SCOPED_TRACE(bytes);
        server->script({Answer::resetAfter(bytes)});
        const SessionOutcome outcome = run();
        expectWholeSound(outcome);
        EXPECT_EQ(2U, outcome.attempts);
        EXPECT_EQ(2U, outcome.requests);
    }
}

TEST_F(MidUtteranceTest, LostOnAConnectionOfAnEarlierSessionItIsSentAgainAtOnce) {
    server->script({CloudTest::answerGoForward(), Answer::resetAfter(40000)});
    run();
    start();
    stepTo(1600);
    EXPECT_EQ(3U, server->getRequestCount());
    const SessionOutcome outcome = finish();
    expectWholeSound(outcome);
    EXPECT_EQ(1U, outcome.attempts);
    EXPECT_EQ(SPEECH_END_MS, outcome.endMs);
}

TEST_F(MidUtteranceTest, LostRightAfterTheEndOfSpeechItIsSentAgainFromTheFirstFrame) {
    server->script({Answer::never()});
    cutAt(SPEECH_END_MS);
    const SessionOutcome outcome = run();
    expectWholeSound(outcome);
    EXPECT_EQ(SPEECH_END_MS + 2000, outcome.endMs);
    EXPECT_TRUE(server->getRequest(0).complete);
}

// An end in good order shows with one of the next two pieces of sound: when exactly, is libcurl's.
TEST_F(MidUtteranceTest, ClosedInGoodOrderItIsSentAgainFromTheFirstFrame) {
    server->script({Answer::closing().afterBodyBytes(40000)});
    const SessionOutcome outcome = run();
    expectWholeSound(outcome);
    EXPECT_EQ(2U, outcome.requests);
    EXPECT_GE(outcome.endMs, 3300);
    EXPECT_LE(outcome.endMs, 3600);
}

TEST_F(MidUtteranceTest, WhatIsSaidInThePauseIsSentAsWell) {
    cutAt(700);
    start();
    stepTo(2600);
    EXPECT_EQ(1U, server->getRequestCount());
    stepTo(2700);
    ASSERT_EQ(2U, server->getRequestCount());
    EXPECT_NE(std::string::npos, server->getRequest(1).body.find(soundUpTo(2700)));
    finish();
}

TEST_F(MidUtteranceTest, ALossOfTheSecondConnectionIsFinal) {
    server->setDefaultAnswer(Answer::resetAfter(40000));
    const SessionOutcome outcome = run();
    EXPECT_EQ("error ErrorNetwork", outcome.end);
    EXPECT_EQ(2U, outcome.requests);
}

TEST_F(MidUtteranceTest, TheEncodedSoundIsWholeAsWell) {
    configureText(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
    cutAt(1500);
    const SessionOutcome outcome = run();
    EXPECT_EQ("results (go forward)", outcome.end);
    ASSERT_EQ(2U, server->getRequestCount());
    const std::string stream = takeSound(server->getRequest(1).body);
    const auto pages = TestSupport::readOggPages({stream.begin(), stream.end()});
    ASSERT_GE(pages.size(), 10U);
    for (std::size_t i = 0; i < pages.size(); ++i) {
        EXPECT_EQ(i, pages[i].sequenceNumber);
        EXPECT_EQ(i == 0, pages[i].first);
        EXPECT_EQ(i + 1 == pages.size(), pages[i].last);
        EXPECT_TRUE(pages[i].checksumRight);
    }
    EXPECT_EQ(SPEECH_END_MS * SAMPLE_RATE_HZ / 1000, pages.back().granulePosition);
}

}  // namespace

}  // namespace FaultTest
