#include "cli/recording/Stages.h"

#include <gmock/gmock.h>

#include <numeric>

#include "RecordedSession.h"
#include "support/ScratchDirectory.h"

namespace {

using Cli::measureStages;
using Cli::StageTimes;
using ::testing::ElementsAre;
using Json = nlohmann::ordered_json;
using TestSupport::makeStreamedSession;
using TestSupport::RecordedSession;

class StagesTest : public ::testing::Test {
  protected:
    StageTimes measure(const RecordedSession& session, bool hasSound = true) {
        session.write(directory.path("one"), hasSound);
        StageTimes times = measureStages(Cli::Recording(directory.path("one")));
        EXPECT_EQ(std::accumulate(times.ms.begin(), times.ms.end(), int64_t{0}), times.totalMs());
        return times;
    }

    /** The stages behind the detector's wait. */
    static std::vector<int64_t> afterStop(const StageTimes& times) {
        return {times.ms.begin() + 2, times.ms.end()};
    }

    const TestSupport::ScratchDirectory directory;
};

TEST_F(StagesTest, BeginAtTheEndOfSpeech) {
    const StageTimes times = measure(makeStreamedSession());
    EXPECT_EQ(times.missing, "");
    EXPECT_TRUE(times.knowsSpeechEnd);
    EXPECT_EQ(times.endMs, 2500);
    // The voice ends 1,000 ms into the sound, whose samples arrive 20 ms later; the detector holds
    // on to speech for up to 100 ms.
    EXPECT_GE(times.beginMs, 1020);
    EXPECT_LE(times.beginMs, 1120);
    // The piece with the end of speech leaves 5 ms after its buffer has arrived, on the 100 ms.
    EXPECT_EQ((times.beginMs + times.ms[0]) % 100, 25);
    EXPECT_LE(times.ms[0], 105);
    EXPECT_EQ(times.beginMs + times.ms[0] + times.ms[1], 2020);
    EXPECT_THAT(afterStop(times), ElementsAre(20, 0, 30, 420, 10));
}

TEST_F(StagesTest, OfAWholeRequestCountItsConnection) {
    RecordedSession session = makeStreamedSession();
    // A later request takes the place of the streamed one.
    session.add(2050, "attempt", {{"attempt", 2}, {"streamed", false}, {"bytes", 64000}});
    session.add(2250, "connection", {{"attempt", 2}, {"new", true}});
    session.add(2260, "sent", {{"attempt", 2}, {"bytes", 64000}});
    session.add(2470, "attemptEnd", {{"attempt", 2}, {"code", 200}});
    const StageTimes times = measure(session);
    EXPECT_THAT(afterStop(times), ElementsAre(20, 210, 10, 210, 30));
    // Nothing leaves before the end of recording, so only the recorder's delay counts.
    EXPECT_EQ((times.beginMs + times.ms[0]) % 100, 20);
}

TEST_F(StagesTest, AreRoundedSoThatTheSumIsTheTotal) {
    RecordedSession session;
    session.addSound(std::vector<int16_t>(RecordedSession::RATE_HZ));
    session.addEvent(1000.4, "recordingDone");
    session.add(1000.8, "encoded", {{"last", true}});
    session.add(1000.9, "attempt", {{"attempt", 1}});
    session.add(1001.3, "connection", {{"attempt", 1}});
    session.add(1001.7, "sent", {{"attempt", 1}});
    session.add(1002.2, "attemptEnd", {{"attempt", 1}});
    session.addEvent(1002.6, "results");
    const StageTimes times = measure(session);
    EXPECT_EQ(times.totalMs(), 3);
    EXPECT_THAT(times.ms, ElementsAre(0, 0, 1, 0, 1, 0, 1));
}

TEST_F(StagesTest, WithoutSoundBeginWhereRecordingStops) {
    const StageTimes times = measure(makeStreamedSession(), false);
    EXPECT_FALSE(times.knowsSpeechEnd);
    EXPECT_EQ(times.beginMs, 2020);
    EXPECT_THAT(times.ms, ElementsAre(0, 0, 20, 0, 30, 420, 10));
}

TEST_F(StagesTest, EndWithAnErrorAsWithResults) {
    RecordedSession session;
    session.addEvent(1000, "recordingDone");
    session.add(1100, "attempt", {{"attempt", 1}});
    session.add(1400, "attemptEnd", {{"attempt", 1}, {"code", -1}});
    session.addEvent(1500, "error", {{"code", 7}, {"name", "ErrorNetwork"}});
    EXPECT_THAT(measure(session).ms, ElementsAre(0, 0, 0, 0, 0, 400, 100));
}

TEST_F(StagesTest, AreMissingWhereThereIsNothingToMeasure) {
    RecordedSession session;
    EXPECT_EQ(measure(session).missing, "the session has neither results nor an error");
    session.addEvent(900, "error");
    EXPECT_EQ(measure(session).missing, "the session ended with an error while it recorded");
    session.addEvent(1000, "results");
    EXPECT_EQ(measure(session).missing, "the results came before the end of recording");
}

TEST_F(StagesTest, OfBrokenRecordingsAreStillWithinTheSession) {
    RecordedSession session = makeStreamedSession();
    session.session["engine"] = Json{{"vad", "engine=none;subengine=none;framems=-1"}};
    session.add(2010, "buffer", {{"offset", 9000000000000000}, {"bytes", 9000000000000000}});
    session.add(2011, "buffer", {{"offset", -9000000000000000}, {"bytes", "many"}});
    session.add(2012, "attempt", {{"attempt", "none"}, {"streamed", 1}});
    session.add(9e9, "sent", {{"attempt", 1}});
    session.add(-9e9, "encoded");
    const StageTimes times = measure(session);
    EXPECT_EQ(times.missing, "");
    for (const int64_t ms : times.ms) {
        EXPECT_GE(ms, 0);
    }
    EXPECT_EQ(times.endMs, 2500);
    session.session["engine"] = 7;
    EXPECT_EQ(measure(session).missing, "");
}

}  // namespace
