// "talvox endpoint" over small corpora of voice-like sound.
#include <gmock/gmock.h>
#include <sndfile.h>

#include <clocale>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <sstream>

#include "SoundFiles.h"
#include "ToolProcess.h"
#include "cli/CommandLine.h"
#include "cli/corpus/Labels.h"
#include "support/CommaLocale.h"
#include "support/ScratchDirectory.h"
#include "talvox/EndOfSpeech.h"

namespace {

using ::testing::HasSubstr;
using ::testing::StartsWith;
using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;
using TestSupport::ToolResult;
using Json = nlohmann::json;

const int RATE_HZ = 16000;

/** A corpus of utterances with two words each, labelled as they were made. */
class ToolEndpointTest : public ::testing::Test {
  protected:
    ToolEndpointTest() {
        std::filesystem::create_directories(directory.path("quiet/far"));
        std::filesystem::create_directories(directory.path("loud"));
        for (int number = 0; number < 4; ++number) {
            addUtterance("quiet/far/a" + std::to_string(number), 300 + 110 * number, 150);
            addUtterance("loud/b" + std::to_string(number), 900, 300 + 400 * number);
        }
    }

    /** Two words of half a second after a lead; 3 s behind them. */
    void addUtterance(const std::string& name, int leadMs, int pauseMs) {
        std::vector<int16_t> samples;
        const auto addSilence = [&samples](int ms) {
            samples.resize(samples.size() + static_cast<std::size_t>(ms) * RATE_HZ / 1000);
        };
        const std::vector<int16_t> word = TestSupport::voiceLike(RATE_HZ, 0.5);
        addSilence(leadMs);
        samples.insert(samples.end(), word.begin(), word.end());
        addSilence(pauseMs);
        samples.insert(samples.end(), word.begin(), word.end());
        addSilence(3000);
        write(name, samples,
              Cli::labelText({{leadMs, leadMs + 500, "one"},
                              {leadMs + 500 + pauseMs, leadMs + 1000 + pauseMs, "two"}},
                             0));
    }

    void write(const std::string& name, const std::vector<int16_t>& samples,
               const std::string& labels) {
        ASSERT_TRUE(TestSupport::writeSoundFile(
            directory.path(name + ".wav"), SF_FORMAT_WAV | SF_FORMAT_PCM_16, RATE_HZ, 1, samples));
        directory.write(name + ".txt", labels);
    }

    static std::vector<Json> lines(const std::string& text) {
        std::vector<Json> objects;
        std::istringstream in(text);
        for (std::string line; std::getline(in, line);) {
            objects.push_back(Json::parse(line));
        }
        return objects;
    }

    ToolResult score(std::vector<std::string> options = {}) {
        options.insert(options.begin(), {"endpoint", "score", directory.path(), "--json"});
        return runTalvox(options);
    }

    Json row(const ToolResult& result, const std::string& name) {
        for (const Json& object : lines(result.out)) {
            if (object["name"] == name) {
                return object;
            }
        }
        ADD_FAILURE() << "no row " << name << " in " << result.out;
        return {};
    }

    const ScratchDirectory directory;
};

TEST_F(ToolEndpointTest, HasARowForAllForEachGroupAndForEachLengthOfPause) {
    const ToolResult result = score();
    EXPECT_EQ(result.status, 0) << result.err;
    EXPECT_EQ(result.err, "");
    std::vector<std::string> names;
    for (const Json& object : lines(result.out)) {
        names.push_back(object["kind"].get<std::string>() + ' ' +
                        object["name"].get<std::string>());
    }
    EXPECT_THAT(names,
                ::testing::ElementsAre("all all", "group loud", "group quiet/far",
                                       "pause up to 0.5 s", "pause up to 1 s", "pause up to 2 s"));
    const Json all = row(result, "all");
    EXPECT_EQ(all["sessions"], 8);
    EXPECT_EQ(all["missed"]["value"], 0.0);
    // Pauses of 1.1 and 1.5 s exceed the span of a second in which the end is looked for.
    EXPECT_EQ(all["early"]["value"], 0.25);
    EXPECT_EQ(row(result, "up to 2 s")["early"]["value"], 1.0);
    EXPECT_LE(all["early"]["low"], 0.125);
    EXPECT_GE(all["early"]["high"], 0.375);
}

TEST_F(ToolEndpointTest, AgreesWithWhatASessionReports) {
    for (const auto& entry : std::filesystem::recursive_directory_iterator(directory.path())) {
        if (entry.path().extension() != ".wav") {
            continue;
        }
        const ToolResult session =
            runTalvox({"vad", "--file", entry.path().string(), "--as-session", "--json"});
        int64_t beginMs = -1;
        int64_t endMs = -1;
        for (const Json& line : lines(session.out)) {
            beginMs = line["event"] == "speakingBegin" ? line["ms"].get<int64_t>() : beginMs;
            endMs = line["event"] == "recordingDone" ? line["ms"].get<int64_t>() : endMs;
        }
        const ScratchDirectory one;
        std::filesystem::copy(entry.path(), one.path("a.wav"));
        std::filesystem::path labels = entry.path();
        labels.replace_extension(".txt");
        std::filesystem::copy(labels, one.path("a.txt"));
        const std::vector<Cli::Label> speech = Cli::readLabels(one.path("a.txt"), 20000);
        const ToolResult result = runTalvox({"endpoint", "score", one.path(), "--json"});
        const Json all = lines(result.out).at(0);
        EXPECT_EQ(all["beginLateMs"]["value"], beginMs - speech.front().startMs);
        if (endMs - 20 < speech.back().endMs) {
            EXPECT_EQ(all["early"]["value"], 1.0);
        } else {
            EXPECT_EQ(all["endLateMs"]["value"], endMs - speech.back().endMs);
        }
    }
}

TEST_F(ToolEndpointTest, CountsASessionThatSpeechFillsToItsLimitAsNeverEnded) {
    std::vector<int16_t> samples(RATE_HZ / 2);
    const std::vector<int16_t> speech = TestSupport::voiceLike(RATE_HZ, 21);
    samples.insert(samples.end(), speech.begin(), speech.end());
    const ScratchDirectory one;
    ASSERT_TRUE(TestSupport::writeSoundFile(one.path("a.wav"), SF_FORMAT_WAV | SF_FORMAT_PCM_16,
                                            RATE_HZ, 1, samples));
    one.write("a.txt", "0.5\t19.5\tspeech\n");
    const ToolResult result = runTalvox({"endpoint", "score", one.path(), "--json"});
    const Json all = lines(result.out).at(0);
    EXPECT_EQ(all["missed"]["value"], 0.0);
    EXPECT_EQ(all["early"]["value"], 0.0);
    EXPECT_EQ(all["unended"]["value"], 1.0);
    EXPECT_EQ(all["endLateMs"]["value"], "never");
}

TEST_F(ToolEndpointTest, FindsLabelsThatAreWrongByTenMilliseconds) {
    const Json before = row(score(), "quiet/far");
    for (int number = 0; number < 4; ++number) {
        const std::string path = directory.path("quiet/far/a" + std::to_string(number) + ".txt");
        std::vector<Cli::Label> speech = Cli::readLabels(path, 20000);
        speech.front().startMs -= 10;
        speech.back().endMs += 20;
        directory.write("quiet/far/a" + std::to_string(number) + ".txt", Cli::labelText(speech, 0));
    }
    const Json behind = row(score(), "quiet/far");
    EXPECT_EQ(behind["beginLateMs"]["value"], before["beginLateMs"]["value"].get<int>() + 10);
    EXPECT_EQ(behind["endLateMs"]["value"], before["endLateMs"]["value"].get<int>() - 20);
    EXPECT_EQ(behind["endLateMs"]["p90"], before["endLateMs"]["p90"].get<int>() - 20);
}

TEST_F(ToolEndpointTest, DoesNotDependOnThreads) {
    const std::vector<std::string> settings = {"--vad", "", "--vad", "preset:dictation"};
    std::vector<std::string> one = settings;
    one.insert(one.end(), {"--jobs", "1"});
    std::vector<std::string> many = settings;
    many.insert(many.end(), {"--jobs", "7"});
    const ToolResult result = score(one);
    EXPECT_EQ(lines(result.out).size(), 12U);
    EXPECT_EQ(score(many).out, result.out);
}

TEST_F(ToolEndpointTest, DoesNotDependOnTheLocale) {
    const auto run = [this](const char* form) {
        std::istringstream in;
        std::ostringstream out;
        std::ostringstream err;
        Cli::LogOutput log(err);
        Cli::Console console{in, out, err, false};
        const std::string folder = directory.path();
        std::vector<const char*> arguments = {"talvox",       "endpoint", "score",
                                              folder.c_str(), "--vad",    "activityoff=.15"};
        if (form != nullptr) {
            arguments.push_back(form);
        }
        EXPECT_EQ(Cli::runTool(static_cast<int>(arguments.size()), arguments.data(), console, log),
                  0);
        return out.str() + err.str();
    };
    const char* const forms[] = {nullptr, "--json", "--csv"};
    std::vector<std::string> expected;
    for (const char* form : forms) {
        expected.push_back(run(form));
    }
    const TestSupport::CommaLocale locale;
    if (!locale.isSet()) {
        GTEST_SKIP() << "needs the sources of locales (package locales)";
    }
    for (std::size_t index = 0; index < expected.size(); ++index) {
        EXPECT_EQ(run(forms[index]), expected[index]);
    }
}

TEST_F(ToolEndpointTest, NamesAndSkipsWhatItCannotScoreAndEndsWithStatusTwo) {
    const std::string expected = score().out;
    directory.write("loud/broken.wav", "not sound");
    directory.write("loud/empty.wav", "");
    const std::vector<int16_t> second(RATE_HZ, 1);
    write("loud/overlap", second, "0.1\t0.5\ta\n0.4\t0.6\tb\n");
    write("loud/outside", second, "0.1\t1.5\ta\n");
    write("loud/silent", second, "");
    write("loud/unlabelled", second, "");
    std::filesystem::remove(directory.path("loud/unlabelled.txt"));
    write("loud/late", std::vector<int16_t>(std::size_t{RATE_HZ} * 25, 1), "0.1\t21\ta\n");
    const ToolResult result = score();
    EXPECT_EQ(result.status, 2);
    EXPECT_EQ(result.out, expected);
    for (const char* fault :
         {"loud/broken.wav: it is not sound of a known format\n",
          "loud/empty.wav: the file is empty\n", "loud/overlap.txt:2: the label begins at 0.400 s",
          "loud/outside.txt:1: the label ends at 1.500 s, behind the end of the sound (1.000 s)\n",
          "loud/silent.txt:1: there is no label",
          "loud/unlabelled.txt:1: cannot read it: No such file or directory\n",
          "loud/late.txt: the last label ends at 21.000 s, but a session takes 20 s of sound"}) {
        EXPECT_THAT(result.err, HasSubstr(directory.path(fault)));
    }
}

TEST_F(ToolEndpointTest, ScoresNoiseInPiecesOfFiveSeconds) {
    write("noise", std::vector<int16_t>(std::size_t{RATE_HZ} * 16, 0), "0\t16\t(noise)\n");
    const Json noise = row(score(), ".");
    EXPECT_EQ(noise["sessions"], 3);
    EXPECT_EQ(noise["sessionsWithSpeech"], 0);
    EXPECT_EQ(noise["falseBegin"]["value"], 0.0);
    EXPECT_EQ(noise["early"]["value"], nullptr);
    EXPECT_EQ(noise["excessMs"]["value"], 5000);
}

TEST_F(ToolEndpointTest, WarnsOfShortTailsAndOfMistakesInTheParameters) {
    write("short", TestSupport::voiceLike(RATE_HZ, 1), "0\t1\ta\n");
    const ToolResult result = score({"--vad", "colour=red", "--vad", "colour=red;framems=20"});
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.err,
              "talvox: warning: vad: there is no parameter \"colour\"\n"
              "talvox: warning: 1 sound goes on for less than 2 s behind the last label; later "
              "ends count as never\n");
}

TEST_F(ToolEndpointTest, PresetsStandForTheirTexts) {
    const std::string sound = directory.path("loud/b1.wav");
    const auto run = [&sound](const std::string& vad) {
        return runTalvox({"vad", "--file", sound, "--json", "--vad", vad}).out;
    };
    EXPECT_EQ(run("preset:command"), run(Talvox::EndOfSpeech::COMMAND));
    EXPECT_NE(run("preset:command"), run(Talvox::EndOfSpeech::DICTATION));
    const ToolResult unknown = runTalvox({"recognize", "--mic", "--vad", "preset:loud"});
    EXPECT_EQ(unknown.status, 2);
    EXPECT_EQ(unknown.err,
              "talvox: there is no preset \"loud\"; there are command, dictation, noisy\n");
}

TEST_F(ToolEndpointTest, PrintsATableAndCsv) {
    const ToolResult table = runTalvox({"endpoint", "score", directory.path()});
    EXPECT_THAT(table.out, StartsWith("(defaults)\n"));
    EXPECT_THAT(table.out, HasSubstr("\n  quiet/far            4     0.0"));
    const ToolResult csv = runTalvox(
        {"endpoint", "score", directory.path(), "--csv", "--vad", "analyzems=900;framems=20"});
    EXPECT_THAT(csv.out, StartsWith("vad,kind,name,sessions,sessionsWithSpeech,missed,missedLow,"));
    EXPECT_THAT(csv.out, HasSubstr("\nanalyzems=900;framems=20,group,quiet/far,4,4,0.0,0.0,0.75,"));
}

TEST_F(ToolEndpointTest, TakesOnlyTheGroupsThatAreAskedFor) {
    EXPECT_EQ(row(score({"--groups", "quiet*"}), "all")["sessions"], 4);
    EXPECT_EQ(row(score({"--groups", "quiet*,loud"}), "all")["sessions"], 8);
    EXPECT_EQ(row(score({"--pause-max", "300"}), "all")["sessions"], 5);
    const ToolResult none = score({"--groups", "quiet"});
    EXPECT_EQ(none.status, 2);
    EXPECT_THAT(none.err, HasSubstr("there is no sound in "));
}

TEST_F(ToolEndpointTest, SweepsAGridAndSaysWhatToSet) {
    const ToolResult result =
        runTalvox({"endpoint", "sweep", directory.path(), "--grid",
                   "analyzems=600,1000,1800;activityoff=.1:.2:.1", "--early", "0%", "--json"});
    ASSERT_EQ(result.status, 0) << result.err;
    EXPECT_EQ(result.err, "");
    const std::vector<Json> objects = lines(result.out);
    ASSERT_EQ(objects.size(), 7U);
    for (std::size_t index = 0; index < 6; ++index) {
        EXPECT_EQ(objects[index]["event"], "point");
    }
    EXPECT_EQ(objects[0]["vad"], "analyzems=600;activityoff=0.1");
    const Json& advice = objects[6];
    EXPECT_EQ(advice["event"], "advice");
    // Only a span beyond the longest pause keeps all words.
    EXPECT_THAT(advice["vad"].get<std::string>(), StartsWith("analyzems=1800;"));
    EXPECT_EQ(advice["meetsWanted"], true);
    EXPECT_EQ(advice["folds"], 5);
    const ToolResult table =
        runTalvox({"endpoint", "sweep", directory.path(), "--grid",
                   "analyzems=600,1000,1800;activityoff=.1:.2:.1", "--latency", "600"});
    EXPECT_THAT(table.out, HasSubstr("6 points; the best trade-offs of words lost"));
    EXPECT_THAT(table.out, HasSubstr("\nwanted: end at most 600 ms late\n"));
    EXPECT_THAT(table.out, HasSubstr("\n  held out"));
}

TEST_F(ToolEndpointTest, GoesOnWithASweepThatWasInterrupted) {
    const std::vector<std::string> sweep = {
        "endpoint", "sweep", directory.path(), "--grid", "analyzems=600,1800", "--json"};
    const ToolResult whole = runTalvox(sweep);
    const std::string store = ScratchDirectory::read(directory.path(".talvox-sweep"));
    // As a process leaves it that is killed while it writes the sixth line.
    std::size_t end = 0;
    for (int line = 0; line < 5; ++line) {
        end = store.find('\n', end + 1);
    }
    directory.write(".talvox-sweep", store.substr(0, end + 20));
    const ToolResult again = runTalvox(sweep);
    EXPECT_EQ(again.out, whole.out);
    EXPECT_EQ(again.err, "talvox: 5 of 8 sounds were scored before\n");
    EXPECT_EQ(runTalvox(sweep).err, "talvox: 8 of 8 sounds were scored before\n");
    std::vector<std::string> afresh = sweep;
    afresh.emplace_back("--start-over");
    EXPECT_EQ(runTalvox(afresh).err, "");
}

TEST_F(ToolEndpointTest, RefusesWrongUsage) {
    const auto expectRefused = [](const std::vector<std::string>& arguments,
                                  const std::string& reason) {
        const ToolResult result = runTalvox(arguments);
        EXPECT_EQ(result.status, 2);
        EXPECT_EQ(result.out, "");
        EXPECT_THAT(result.err, HasSubstr(reason));
    };
    expectRefused({"endpoint"}, "subcommand");
    expectRefused({"endpoint", "score"}, "DIR");
    expectRefused({"endpoint", "sweep", directory.path()}, "--grid");
    expectRefused({"endpoint", "score", directory.path(), "--vad", "preset:loud"},
                  "there is no preset \"loud\"; there are command, dictation, noisy");
    expectRefused({"endpoint", "score", directory.path(), "--session-mode", "x"}, "--session-mode");
    expectRefused({"endpoint", "sweep", directory.path(), "--grid", "a=1:2", "--early", "1%"},
                  "--grid a=1:2: a range is FIRST:LAST:STEP");
    for (const char* share : {"x", "101%", "-1%", "1.5", "%", "nan"}) {
        expectRefused(
            {"endpoint", "sweep", directory.path(), "--grid", "analyzems=600", "--early", share},
            "is not a share, such as 1%");
    }
}

}  // namespace
