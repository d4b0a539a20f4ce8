// The generated corpus: its formulas, its sounds, its labels.
#include <gmock/gmock.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <map>

#include "ToolProcess.h"
#include "cli/corpus/CorpusFiles.h"
#include "cli/corpus/Dice.h"
#include "cli/corpus/Labeller.h"
#include "cli/corpus/Noise.h"
#include "cli/corpus/Speaker.h"
#include "cli/corpus/Waves.h"
#include "support/ChildProcess.h"
#include "support/ScratchDirectory.h"

namespace {

using Cli::CorpusEntry;
using Cli::CorpusSound;
using ::testing::HasSubstr;
using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;
using TestSupport::ToolResult;

uint64_t checksum(const std::vector<int16_t>& samples) {
    uint64_t sum = 14695981039346656037U;
    for (const int16_t sample : samples) {
        sum = (sum ^ static_cast<uint16_t>(sample)) * 1099511628211U;
    }
    return sum;
}

/** The bytes of all files below a folder. */
std::map<std::string, std::string> readAll(const std::string& folder) {
    std::map<std::string, std::string> files;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(folder)) {
        if (entry.is_regular_file()) {
            files[entry.path().lexically_relative(folder)] =
                ScratchDirectory::read(entry.path().string());
        }
    }
    return files;
}

ToolResult make(const std::string& folder, const std::string& seed = "1",
                const std::string& noises = "hum") {
    return runTalvox({"corpus", "make", folder, "--seed", seed, "--utterances", "3", "--noise",
                      noises, "--ratio", "20,0", "--noise-alone", "2"});
}

TEST(CorpusFormulas, GiveTheSameSamplesOnEveryMachine) {
    const std::map<std::string, uint64_t> expected = {
        {"white", 5260348664446202383U},  {"pink", 2366905398533382149U},
        {"wind", 14785172967582331111U},  {"hum", 3768964269320536787U},
        {"clicks", 4359462338206103323U}, {"tones", 15646453205126224438U},
    };
    ASSERT_EQ(Cli::formulaNoises().size(), expected.size());
    for (const auto& [kind, sum] : expected) {
        Cli::Wave wave = Cli::makeNoise(kind, 32000, Cli::Dice(7));
        ASSERT_GT(Cli::rms(wave), 0.0) << kind;
        Cli::scale(wave, 3000 / Cli::rms(wave));
        EXPECT_EQ(checksum(Cli::toSamples(Cli::halveRate(wave))), sum) << kind;
    }
}

TEST(CorpusFormulas, HaveTheSineOfEveryAngle) {
    EXPECT_DOUBLE_EQ(Cli::sineOfTurns(0), 0);
    EXPECT_NEAR(Cli::sineOfTurns(1.0 / 12), 0.5, 1e-12);
    EXPECT_NEAR(Cli::sineOfTurns(0.25), 1, 1e-12);
    EXPECT_NEAR(Cli::sineOfTurns(5.0 / 12), 0.5, 1e-12);
    EXPECT_NEAR(Cli::sineOfTurns(7.0 / 12), -0.5, 1e-12);
    EXPECT_NEAR(Cli::sineOfTurns(1000.75), -1, 1e-9);
}

TEST(CorpusFormulas, HalveTheRateOfWhatFitsAndTakeOutTheRest) {
    const auto tone = [](int hz) {
        Cli::Wave wave(16000);
        for (std::size_t index = 0; index < wave.size(); ++index) {
            wave[index] = 1000 * Cli::sineOfTurns(static_cast<double>(index) * hz / 16000);
        }
        return wave;
    };
    const Cli::Wave low = Cli::halveRate(tone(1000));
    ASSERT_EQ(low.size(), 8000U);
    for (std::size_t index = 100; index < 200; ++index) {
        EXPECT_NEAR(low[index], 1000 * Cli::sineOfTurns(static_cast<double>(index) / 8), 2);
    }
    EXPECT_LT(Cli::rms(Cli::halveRate(tone(5000)), 100, 7900), 2);
}

TEST(CorpusFormulas, RoundAndCutSamples) {
    EXPECT_EQ(Cli::toSamples({0.4, 0.5, -0.5, -0.4, 40000, -40000, 32767.2}),
              (std::vector<int16_t>{0, 1, -1, 0, 32767, -32768, 32767}));
}

TEST(CorpusFormulas, FindSpeechByItsEnergyToTenMilliseconds) {
    std::vector<int16_t> samples(1600, 0);
    // 41 dB below the loudest, then speech with a quiet end of 39 dB below it.
    samples.insert(samples.end(), 160, 89);
    samples.insert(samples.end(), 1600, 10000);
    samples.insert(samples.end(), 160, 112);
    samples.insert(samples.end(), 1000, 0);
    EXPECT_EQ(Cli::trimSpeech(samples).size(), 1760U);
    EXPECT_EQ(Cli::trimSpeech(samples).front(), 10000);
    EXPECT_TRUE(Cli::trimSpeech(std::vector<int16_t>(1600, 0)).empty());
    EXPECT_TRUE(Cli::trimSpeech({}).empty());
}

class CorpusTest : public ::testing::Test {
  protected:
    void SetUp() override {
        if (!TestSupport::ChildProcess::isInstalled("flite")) {
            GTEST_SKIP() << "needs the package flite";
        }
    }

    const ScratchDirectory directory;
};

TEST_F(CorpusTest, IsTheSameForASeedAndAnotherForAnother) {
    const std::string first = directory.path("first");
    const ToolResult result = make(first, "5", "hum,babble");
    ASSERT_EQ(result.status, 0) << result.err;
    EXPECT_EQ(result.err, "");
    // Three utterances in five conditions; two noises at two levels and two rates.
    EXPECT_THAT(result.out, HasSubstr("23 files, "));
    EXPECT_EQ(make(directory.path("second"), "5", "hum,babble").out, result.out);
    const std::map<std::string, std::string> files = readAll(first);
    EXPECT_EQ(files.size(), 46U);
    EXPECT_EQ(files, readAll(directory.path("second")));
    ASSERT_EQ(make(directory.path("third"), "6").status, 0);
    for (const auto& [name, bytes] : readAll(directory.path("third"))) {
        const auto same = files.find(name);
        if (name.find(".wav") != std::string::npos && same != files.end()) {
            EXPECT_NE(same->second, bytes) << name;
        }
    }
}

TEST_F(CorpusTest, LabelsTheCleanSoundToTenMilliseconds) {
    const std::string folder = directory.path("corpus");
    ASSERT_EQ(make(folder).status, 0);
    int stretches = 0;
    for (const CorpusEntry& entry : Cli::findSounds(folder, {"clean"})) {
        const CorpusSound sound = Cli::readLabelledSound(entry);
        const auto perMs = static_cast<std::size_t>(sound.rateHz / 1000);
        const auto peakOf = [&](int64_t fromMs, int64_t toMs) {
            int peak = 0;
            for (auto at = static_cast<std::size_t>(fromMs) * perMs;
                 at < static_cast<std::size_t>(toMs) * perMs; ++at) {
                peak = std::max(peak, std::abs(int{sound.samples[at]}));
            }
            return peak;
        };
        int64_t silentFromMs = 0;
        for (const Cli::Label& label : sound.speech) {
            EXPECT_EQ(label.startMs % 10 + label.endMs % 10, 0);
            // Halving the rate spreads a sample over its neighbours.
            EXPECT_EQ(peakOf(silentFromMs + (silentFromMs > 0 ? 4 : 0), label.startMs - 4), 0);
            EXPECT_GT(peakOf(label.startMs, label.startMs + 10), 0) << entry.name;
            EXPECT_GT(peakOf(label.endMs - 10, label.endMs), 0) << entry.name;
            silentFromMs = label.endMs;
            ++stretches;
        }
        EXPECT_EQ(peakOf(silentFromMs + 4, sound.lengthMs()), 0);
        EXPECT_EQ(sound.lengthMs() - silentFromMs, 3000);
    }
    EXPECT_GE(stretches, 3);
}

TEST_F(CorpusTest, KeepsTheRatioOfSpeechToNoise) {
    const std::string folder = directory.path("corpus");
    ASSERT_EQ(make(folder).status, 0);
    for (const CorpusEntry& entry : Cli::findSounds(folder, {"hum-*"})) {
        const CorpusSound noisy = Cli::readLabelledSound(entry);
        CorpusEntry cleanEntry = entry;
        cleanEntry.path.replace(cleanEntry.path.find(entry.group), entry.group.size(), "clean");
        const CorpusSound clean = Cli::readSound(cleanEntry);
        double speech = 0;
        double speechSamples = 0;
        double noise = 0;
        const auto perMs = static_cast<std::size_t>(noisy.rateHz / 1000);
        for (const Cli::Label& label : noisy.speech) {
            for (auto at = static_cast<std::size_t>(label.startMs) * perMs;
                 at < static_cast<std::size_t>(label.endMs) * perMs; ++at) {
                speech += static_cast<double>(clean.samples[at]) * clean.samples[at];
                ++speechSamples;
            }
        }
        for (std::size_t at = 0; at < noisy.samples.size(); ++at) {
            const double difference = noisy.samples[at] - clean.samples[at];
            noise += difference * difference;
        }
        const double ratioDb = 10 * std::log10(speech / speechSamples /
                                               (noise / static_cast<double>(noisy.samples.size())));
        EXPECT_NEAR(ratioDb, entry.group == "hum-20" ? 20 : 0, 1) << entry.name;
    }
}

TEST_F(CorpusTest, ProposesTheLabelsOfTheCleanSound) {
    const std::string folder = directory.path("corpus");
    ASSERT_EQ(make(folder).status, 0);
    for (const CorpusEntry& entry : Cli::findSounds(folder, {"clean"})) {
        const CorpusSound sound = Cli::readLabelledSound(entry);
        const std::vector<Cli::Label> proposed = Cli::proposeLabels(sound);
        ASSERT_FALSE(proposed.empty()) << entry.name;
        EXPECT_NEAR(static_cast<double>(proposed.front().startMs),
                    static_cast<double>(sound.speech.front().startMs), 20);
        EXPECT_NEAR(static_cast<double>(proposed.back().endMs),
                    static_cast<double>(sound.speech.back().endMs), 20);
    }
}

TEST_F(CorpusTest, LabelsRecordingsAndKeepsLabelsThatExist) {
    const std::string folder = directory.path("corpus");
    ASSERT_EQ(make(folder).status, 0);
    const std::vector<CorpusEntry> sounds = Cli::findSounds(folder, {"clean"});
    const std::string label = sounds[0].labelPath;
    const std::string before = ScratchDirectory::read(sounds[1].labelPath);
    std::filesystem::remove(label);
    std::filesystem::create_directories(folder + "/odd");
    directory.write("corpus/odd/broken.wav", "no sound");

    const ToolResult result = runTalvox({"corpus", "label", folder});
    EXPECT_EQ(result.status, 2);
    EXPECT_THAT(result.err, HasSubstr("odd/broken.wav: it is not sound of a known format\n"));
    EXPECT_THAT(result.out, HasSubstr(sounds[0].name + ": "));
    EXPECT_THAT(result.out, HasSubstr(" of speech from "));
    EXPECT_THAT(result.out, HasSubstr(sounds[1].name + ": has labels\n"));
    EXPECT_NO_THROW(Cli::readLabelledSound(sounds[0]));
    EXPECT_EQ(ScratchDirectory::read(sounds[1].labelPath), before);
}

TEST(CorpusUsage, RefusesWhatItCannotMake) {
    const ScratchDirectory directory;
    const auto expectRefused = [](const std::vector<std::string>& arguments,
                                  const std::string& reason) {
        const ToolResult result = runTalvox(arguments);
        EXPECT_EQ(result.status, 2);
        EXPECT_THAT(result.err, HasSubstr(reason));
    };
    expectRefused({"corpus"}, "subcommand");
    expectRefused({"corpus", "make"}, "DIR");
    expectRefused({"corpus", "make", directory.path("a"), "--noise", "rain"}, "--noise");
    expectRefused({"corpus", "make", directory.path("a"), "--ratio", "7"}, "--ratio");
    expectRefused({"corpus", "label", directory.path()}, "there is no sound in ");
    expectRefused({"corpus", "label", directory.path("none")}, "No such file or directory");
}

}  // namespace
