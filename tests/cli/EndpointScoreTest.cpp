// Figures of the end of speech: verdicts on sessions, statistics of verdicts, grids, sweeps.
#include <gmock/gmock.h>

#include <algorithm>
#include <atomic>
#include <cmath>
#include <optional>
#include <stdexcept>

#include "cli/UsageError.h"
#include "cli/endpoint/Grid.h"
#include "cli/endpoint/Statistics.h"
#include "cli/endpoint/Sweep.h"
#include "cli/endpoint/SweepStore.h"
#include "cli/endpoint/VadText.h"
#include "cli/endpoint/Verdict.h"
#include "cli/endpoint/WorkPool.h"
#include "support/ScratchDirectory.h"
#include "talvox/EndOfSpeech.h"

namespace {

using Cli::Listening;
using Cli::Verdict;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using TestSupport::ScratchDirectory;

const std::vector<Cli::Label> SPEECH = {{500, 900, ""}, {1200, 2000, ""}};

Listening session(std::optional<int64_t> beginsMs, Listening::Ending ending, int64_t recordedMs) {
    return {beginsMs, ending, recordedMs + 20, recordedMs};
}

TEST(EndpointVerdict, MeasuresBeginAndEndAgainstFirstAndLastLabel) {
    const Verdict verdict = Cli::compare(session(820, Listening::SPEECH_ENDED, 2900), SPEECH);
    EXPECT_TRUE(verdict.hasSpeech);
    EXPECT_FALSE(verdict.isMissed || verdict.isEarly || verdict.isUnended || verdict.isFalseBegin);
    EXPECT_EQ(verdict.beginLateMs, 320);
    EXPECT_EQ(verdict.endLateMs, 920);
    // 500 ms before the first word, 900 behind the last.
    EXPECT_EQ(verdict.excessMs, 1400);
}

TEST(EndpointVerdict, MovesWithTheLabelsToTheMillisecond) {
    const Listening listening = session(820, Listening::SPEECH_ENDED, 2900);
    const Verdict exact = Cli::compare(listening, SPEECH);
    const Verdict later = Cli::compare(listening, {{510, 900, ""}, {1200, 2010, ""}});
    EXPECT_EQ(*later.beginLateMs, *exact.beginLateMs - 10);
    EXPECT_EQ(*later.endLateMs, *exact.endLateMs - 10);
}

TEST(EndpointVerdict, CountsAnEndBeforeTheLastWordAsEarly) {
    const Verdict verdict = Cli::compare(session(820, Listening::SPEECH_ENDED, 1990), SPEECH);
    EXPECT_TRUE(verdict.isEarly);
    EXPECT_FALSE(verdict.endLateMs.has_value());
    EXPECT_EQ(verdict.excessMs, 500);
    const Verdict exact = Cli::compare(session(820, Listening::SPEECH_ENDED, 2000), SPEECH);
    EXPECT_FALSE(exact.isEarly);
    EXPECT_EQ(exact.endLateMs, 20);
}

TEST(EndpointVerdict, TellsMissedFalseAndUnendedApart) {
    const Verdict missed = Cli::compare(session({}, Listening::NO_VOICE, 5000), SPEECH);
    EXPECT_TRUE(missed.isMissed);
    EXPECT_FALSE(missed.isEarly || missed.isUnended);
    EXPECT_EQ(missed.excessMs, 3500);
    const Verdict falseBegin = Cli::compare(session(499, Listening::SPEECH_ENDED, 2100), SPEECH);
    EXPECT_TRUE(falseBegin.isFalseBegin);
    EXPECT_FALSE(falseBegin.beginLateMs.has_value());
    EXPECT_FALSE(Cli::compare(session(500, Listening::SPEECH_ENDED, 2100), SPEECH).isFalseBegin);
    for (const Listening::Ending ending : {Listening::SOUND_ENDED, Listening::LIMIT_REACHED}) {
        EXPECT_TRUE(Cli::compare(session(820, ending, 5000), SPEECH).isUnended);
    }
    const Verdict noise = Cli::compare(session(720, Listening::SPEECH_ENDED, 1800), {});
    EXPECT_TRUE(noise.isFalseBegin);
    EXPECT_FALSE(noise.hasSpeech || noise.isEarly || noise.isMissed);
    EXPECT_EQ(noise.excessMs, 1800);
}

/** Sessions whose ends are as late as these numbers say. */
std::vector<Verdict> endedLate(const std::vector<int>& latenciesMs) {
    std::vector<Verdict> verdicts;
    verdicts.reserve(latenciesMs.size());
    for (const int latencyMs : latenciesMs) {
        verdicts.push_back(
            Cli::compare(session(820, Listening::SPEECH_ENDED, 1980 + latencyMs), SPEECH));
    }
    return verdicts;
}

TEST(EndpointStatistics, OfADetectorThatIsAlwaysLateByTheSameAreExactlyThat) {
    const Cli::Statistics figures = Cli::summarize(endedLate(std::vector<int>(50, 100)));
    EXPECT_EQ(figures.sessions, 50);
    EXPECT_EQ(figures.endLateMs.value, 100);
    EXPECT_EQ(figures.endLateMs.low, 100);
    EXPECT_EQ(figures.endLateMs.high, 100);
    EXPECT_EQ(figures.endLateP90Ms, 100);
    EXPECT_EQ(figures.early.value, 0);
    EXPECT_EQ(figures.early.low, 0);
    EXPECT_DOUBLE_EQ(figures.early.high, 3.0 / 50);
}

TEST(EndpointStatistics, AreMedianAndNinetiethPercentile) {
    const Cli::Statistics figures =
        Cli::summarize(endedLate({1000, 100, 900, 200, 800, 300, 700, 400, 600, 500}));
    EXPECT_EQ(figures.endLateMs.value, 500);
    EXPECT_EQ(figures.endLateP90Ms, 900);
    EXPECT_LT(figures.endLateMs.low, 500);
    EXPECT_GT(figures.endLateMs.high, 500);
}

TEST(EndpointStatistics, TakeSessionsThatNeverEndForLaterThanAllOthers) {
    std::vector<Verdict> verdicts = endedLate({100, 200, 300});
    verdicts.push_back(Cli::compare(session(820, Listening::SOUND_ENDED, 5000), SPEECH));
    const Cli::Statistics figures = Cli::summarize(verdicts);
    EXPECT_EQ(figures.endLateMs.value, 200);
    EXPECT_EQ(figures.endLateP90Ms, Cli::NEVER);
    EXPECT_EQ(figures.unended.value, 0.25);
}

TEST(EndpointStatistics, HaveBoundsThatHoldTheTrueShare) {
    // 20 of 200: the normal approximation gives 5.8 to 14.2 %.
    std::vector<Verdict> verdicts = endedLate(std::vector<int>(180, 100));
    for (int count = 0; count < 20; ++count) {
        verdicts.push_back(Cli::compare(session(820, Listening::SPEECH_ENDED, 1000), SPEECH));
    }
    const Cli::Statistics figures = Cli::summarize(verdicts);
    EXPECT_DOUBLE_EQ(figures.early.value, 0.1);
    EXPECT_NEAR(figures.early.low, 0.058, 0.01);
    EXPECT_NEAR(figures.early.high, 0.142, 0.01);
}

TEST(EndpointStatistics, OfNothingAreNone) {
    const Cli::Statistics figures = Cli::summarize({});
    EXPECT_EQ(figures.sessions, 0);
    EXPECT_TRUE(std::isnan(figures.early.value));
    EXPECT_TRUE(std::isnan(figures.endLateMs.value));
}

std::string gridFault(const std::string& text) {
    try {
        Cli::parseGrid(text);
    } catch (const Cli::UsageError& error) {
        return error.what();
    }
    return "";
}

TEST(EndpointGrid, HasEveryPointInOrder) {
    EXPECT_THAT(Cli::gridPoints(Cli::parseGrid("analyzems=800:1000:100;activityoff=.1:.2:.05")),
                ElementsAre("analyzems=800;activityoff=0.1", "analyzems=800;activityoff=0.15",
                            "analyzems=800;activityoff=0.2", "analyzems=900;activityoff=0.1",
                            "analyzems=900;activityoff=0.15", "analyzems=900;activityoff=0.2",
                            "analyzems=1000;activityoff=0.1", "analyzems=1000;activityoff=0.15",
                            "analyzems=1000;activityoff=0.2"));
    EXPECT_THAT(Cli::gridPoints(Cli::parseGrid(";aggressiveness=1,3;")),
                ElementsAre("aggressiveness=1", "aggressiveness=3"));
    // Ten steps of a tenth meet the one, which sums of binary fractions do not.
    EXPECT_EQ(Cli::gridPoints(Cli::parseGrid("activityon=0:1:.1")).back(), "activityon=1");
    EXPECT_EQ(Cli::gridPoints(Cli::parseGrid("activityon=0:1:.1")).size(), 11U);
    EXPECT_EQ(Cli::gridPoints(Cli::parseGrid("x=-1:1:2")).front(), "x=-1");
}

TEST(EndpointGrid, RefusesWhatIsMalformedOrTooLarge) {
    EXPECT_EQ(gridFault(""), "--grid has no parameter");
    EXPECT_EQ(gridFault("analyzems"),
              "--grid analyzems: expected NAME=FIRST:LAST:STEP or NAME=VALUE,VALUE");
    EXPECT_EQ(gridFault("a=1:2"), "--grid a=1:2: a range is FIRST:LAST:STEP, with a step above 0");
    for (const char* range : {"a=2:1:1", "a=1:2:0", "a=1:2:-1", "a=1:2:3:4"}) {
        EXPECT_THAT(gridFault(range), HasSubstr("a range is FIRST:LAST:STEP"));
    }
    for (const char* range : {"a=x:2:1", "a=1:2:1e3", "a=1:99999999999999999999:1", "a=1..2:3:1",
                              "a=:2:1", "a=0:1:.0000001", "a=-:1:1"}) {
        EXPECT_THAT(gridFault(range), HasSubstr("is not a decimal number")) << range;
    }
    EXPECT_EQ(gridFault("a=1,,2"), "--grid a=1,,2: a value is empty");
    EXPECT_THAT(gridFault("a=0:1:.000001"), HasSubstr("more than 20000 values"));
    EXPECT_THAT(gridFault("a=1:200:1;b=1:200:1"), HasSubstr("more than 20000 points"));
}

TEST(EndpointVadText, ChangesReplaceWhatHasTheSameEffect) {
    EXPECT_EQ(Cli::mergeVad("analyzems=1;activityon=.5", "activityon=.6"),
              "analyzems=1;activityon=.6");
    EXPECT_EQ(Cli::mergeVad("Analyze_MS off=1;framems=20", "analyzems=2"),
              "framems=20;analyzems=2");
    EXPECT_EQ(Cli::mergeVad("", "a=1"), "a=1");
    EXPECT_EQ(Cli::mergeVad("a=1;", ""), "a=1");
}

TEST(EndpointVadText, NamesStandForPresets) {
    EXPECT_EQ(Cli::expandPreset("preset:dictation"), Talvox::EndOfSpeech::DICTATION);
    EXPECT_EQ(Cli::expandPreset("preset:command"), Talvox::EndOfSpeech::COMMAND);
    EXPECT_EQ(Cli::expandPreset("preset:noisy"), Talvox::EndOfSpeech::NOISY);
    EXPECT_EQ(Cli::expandPreset("preset:dictation;analyzems=7"),
              Cli::mergeVad(Talvox::EndOfSpeech::DICTATION, "analyzems=7"));
    EXPECT_EQ(Cli::expandPreset("framems=20"), "framems=20");
    EXPECT_EQ(Cli::expandPreset(""), "");
    try {
        Cli::expandPreset("preset:loud");
        FAIL();
    } catch (const Cli::UsageError& error) {
        EXPECT_STREQ(error.what(),
                     "there is no preset \"loud\"; there are command, dictation, noisy");
    }
}

TEST(EndpointWorkPool, DoesEachPieceOfWorkOnce) {
    for (const unsigned threads : {0U, 1U, 5U}) {
        std::vector<std::atomic<int>> calls(100);
        Cli::runParallel(calls.size(), threads, [&calls](std::size_t index) { ++calls[index]; });
        EXPECT_TRUE(std::all_of(calls.begin(), calls.end(),
                                [](const std::atomic<int>& count) { return count == 1; }));
    }
    Cli::runParallel(0, 2, [](std::size_t) { FAIL(); });
}

TEST(EndpointWorkPool, ThrowsWhatTheWorkThrows) {
    EXPECT_THROW(Cli::runParallel(10, 3,
                                  [](std::size_t index) {
                                      if (index == 4) {
                                          throw std::runtime_error("no");
                                      }
                                  }),
                 std::runtime_error);
}

/** Sounds on which each setup is early in so many of a hundred, and ends so late in the others. */
class EndpointSweepTest : public ::testing::Test {
  protected:
    struct Setup {
        const char* vad;
        int earlyPercent;
        int latencyMs;
    };

    void scoreAs(const std::vector<Setup>& made) {
        sounds.resize(100);
        std::vector<int> order(100);
        for (int index = 0; index < 100; ++index) {
            // Spread over the parts of the cross-validation.
            order[static_cast<std::size_t>(index)] = index * 37 % 100;
        }
        for (std::size_t index = 0; index < sounds.size(); ++index) {
            sounds[index].entry.name = "group/s" + std::to_string(100 + order[index]) + ".wav";
            sounds[index].hasSpeech = true;
            for (const Setup& setup : made) {
                const bool isEarly = static_cast<int>(index) < setup.earlyPercent;
                sounds[index].bySetup.push_back(
                    isEarly ? std::vector<Verdict>{Cli::compare(
                                  session(820, Listening::SPEECH_ENDED, 1000), SPEECH)}
                            : endedLate({setup.latencyMs}));
            }
        }
        for (const Setup& setup : made) {
            setups.push_back({setup.vad});
        }
        points = Cli::makePoints(sounds, setups);
    }

    Cli::Advice adviceFor(const Cli::Wanted& wanted) const {
        return Cli::advise(sounds, points, wanted);
    }

    std::vector<Cli::ScoredSound> sounds;
    std::vector<Cli::DetectorSetup> setups;
    std::vector<Cli::SweepPoint> points;
};

TEST_F(EndpointSweepTest, MarksTheBestTradeOffs) {
    scoreAs({{"quick", 20, 500},
             {"worse", 20, 700},
             {"slow", 0, 1200},
             {"medium", 5, 900},
             {"dominated", 6, 950}});
    std::vector<std::string> best;
    for (const Cli::SweepPoint& point : points) {
        if (point.isPareto) {
            best.push_back(point.vad);
        }
    }
    EXPECT_THAT(best, ElementsAre("quick", "slow", "medium"));
}

TEST_F(EndpointSweepTest, ChoosesTheQuickestWithinTheBoundsOrTheSafestWithinTheLatency) {
    scoreAs({{"quick", 20, 500}, {"slow", 0, 1200}, {"medium", 5, 900}});
    Cli::Wanted wanted;
    wanted.lost = 0.05;
    EXPECT_EQ(points[adviceFor(wanted).point].vad, "medium");
    EXPECT_TRUE(adviceFor(wanted).meetsWanted);
    wanted.lost = 0.049;
    EXPECT_EQ(points[adviceFor(wanted).point].vad, "slow");
    wanted.lost.reset();
    wanted.latencyMs = 1000;
    EXPECT_EQ(points[adviceFor(wanted).point].vad, "medium");
    wanted.latencyMs = 400;
    EXPECT_EQ(points[adviceFor(wanted).point].vad, "quick");
    EXPECT_FALSE(adviceFor(wanted).meetsWanted);
}

TEST_F(EndpointSweepTest, CountsMissedSpeechAsLost) {
    scoreAs({{"deaf", 0, 500}, {"sound", 3, 900}});
    for (std::size_t index = 0; index < 10; ++index) {
        sounds[index].bySetup[0] = {Cli::compare(session({}, Listening::NO_VOICE, 5000), SPEECH)};
    }
    points = Cli::makePoints(sounds, setups);
    EXPECT_DOUBLE_EQ(points[0].lost(), 0.1);
    Cli::Wanted wanted;
    wanted.lost = 0.05;
    EXPECT_EQ(points[adviceFor(wanted).point].vad, "sound");
}

TEST_F(EndpointSweepTest, JudgesTheChoiceOnSoundsThatDidNotMakeIt) {
    // Without a difference between the parts, they all agree with the whole.
    scoreAs({{"quick", 20, 500}, {"slow", 0, 1200}});
    Cli::Wanted wanted;
    wanted.lost = 0.01;
    const Cli::Advice agreed = adviceFor(wanted);
    EXPECT_EQ(agreed.folds, 5);
    EXPECT_EQ(agreed.foldsThatAgree, 5);
    EXPECT_EQ(agreed.heldOut.sessionsWithSpeech, 100);
    EXPECT_EQ(agreed.heldOut.early.value, 0);
    EXPECT_EQ(agreed.heldOut.endLateMs.value, 1200);

    // All the early ends of "quick" are in one part: the others choose it when that part is held
    // out, and there it fails.
    std::vector<std::string> names;
    for (const Cli::ScoredSound& sound : sounds) {
        names.push_back(sound.entry.name);
    }
    std::sort(names.begin(), names.end());
    for (Cli::ScoredSound& sound : sounds) {
        const auto place = std::find(names.begin(), names.end(), sound.entry.name) - names.begin();
        sound.bySetup[0] = place % 5 == 0
                               ? std::vector<Verdict>{Cli::compare(
                                     session(820, Listening::SPEECH_ENDED, 1000), SPEECH)}
                               : endedLate({500});
    }
    points = Cli::makePoints(sounds, setups);
    const Cli::Advice tuned = adviceFor(wanted);
    EXPECT_EQ(points[tuned.point].vad, "slow");
    EXPECT_EQ(tuned.foldsThatAgree, 4);
    EXPECT_DOUBLE_EQ(tuned.heldOut.early.value, 0.2);
}

class SweepStoreTest : public EndpointSweepTest {
  protected:
    SweepStoreTest() {
        scoreAs({{"a", 20, 500}, {"b", 0, 1200}});
        sounds[0].bySetup[0].push_back(
            Cli::compare(session({}, Listening::NO_VOICE, 5000), SPEECH));
        sound.rateHz = 8000;
        sound.samples = {1, 2, 3};
        sound.speech = SPEECH;
    }

    bool load(const std::vector<Cli::DetectorSetup>& asked, const Cli::CorpusSound& of) {
        const Cli::SweepStore store(path, asked);
        loaded.clear();
        return store.load("group/a.wav", store.fingerprint(of), loaded);
    }

    void save() {
        Cli::SweepStore store(path, setups);
        store.save("group/a.wav", store.fingerprint(sound), sounds[0].bySetup);
    }

    const ScratchDirectory directory;
    const std::string path = directory.path("store");
    Cli::CorpusSound sound;
    std::vector<std::vector<Verdict>> loaded;
};

TEST_F(SweepStoreTest, GivesBackWhatItKept) {
    EXPECT_FALSE(load(setups, sound));
    save();
    ASSERT_TRUE(load(setups, sound));
    ASSERT_EQ(loaded.size(), 2U);
    ASSERT_EQ(loaded[0].size(), 2U);
    EXPECT_TRUE(loaded[0][0].isEarly);
    EXPECT_EQ(loaded[0][0].beginLateMs, 320);
    EXPECT_FALSE(loaded[0][0].endLateMs.has_value());
    EXPECT_TRUE(loaded[0][1].isMissed && loaded[0][1].hasSpeech);
    EXPECT_EQ(loaded[0][1].excessMs, 3500);
    EXPECT_EQ(loaded[1][0].endLateMs, 1200);
}

TEST_F(SweepStoreTest, ForgetsWhatHasChanged) {
    save();
    Cli::CorpusSound changed = sound;
    changed.samples[1] = 3;
    EXPECT_FALSE(load(setups, changed));
    changed = sound;
    changed.speech[1].endMs += 10;
    EXPECT_FALSE(load(setups, changed));
    EXPECT_FALSE(load({{"a"}, {"c"}}, sound));
    EXPECT_FALSE(load({{"a"}}, sound));
    EXPECT_TRUE(load(setups, sound));
}

TEST_F(SweepStoreTest, GoesOnBehindALineThatWasCutOff) {
    save();
    const std::string whole = ScratchDirectory::read(path);
    for (std::size_t length = 0; length + 1 < whole.size(); length += 3) {
        directory.write("store", whole.substr(0, length));
        EXPECT_FALSE(load(setups, sound)) << length;
        save();
        EXPECT_TRUE(load(setups, sound)) << length;
    }
}

}  // namespace
