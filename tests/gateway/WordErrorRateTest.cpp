// What a wait before the speech costs in words: people wait after "speak now", in rooms that are
// never quite silent.
#include <gtest/gtest.h>
#include <pocketsphinx.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <iterator>
#include <map>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include "gateway/RecordedSpeech.h"
#include "gateway/SharedPool.h"
#include "gateway/Utterance.h"
#include "support/ChildProcess.h"
#include "support/ScratchDirectory.h"

namespace {

using Gateway::Utterance;
using Samples = std::vector<int16_t>;
using Words = std::vector<std::string>;

constexpr std::size_t WAIT_SAMPLES = Gateway::SpeechModel::RATE_HZ * 12 / 10;
constexpr double NOISE_SIGMA = 15;

struct Spoken {
    std::string words;
    Samples sound;
};

/** Sound that a wait precedes: noise of a quiet room, the same in every run. */
Samples afterAWait(const Samples& sound) {
    std::mt19937 random(1);
    Samples samples;
    for (std::size_t i = 0; i < WAIT_SAMPLES; ++i) {
        // Twelve uniform numbers add up to a normal one with a deviation of one.
        double sum = -6;
        for (int k = 0; k < 12; ++k) {
            sum += static_cast<double>(random()) / 4294967296.0;
        }
        samples.push_back(static_cast<int16_t>(std::lrint(NOISE_SIGMA * sum)));
    }
    samples.insert(samples.end(), sound.begin(), sound.end());
    return samples;
}

std::vector<Spoken> collectRecordings() {
    const std::string novel = "librivox/sense_and_sensibility_01_austen_64kb-";
    const std::pair<std::string, std::string> recordings[] = {
        {"goforward.raw", "go forward ten meters"},
        {"something.raw", "go somewhere and do something"},
        {"cards/001.wav", "ten of clubs"},
        {"cards/002.wav", "four queen of clubs"},
        {"cards/003.wav", "seven of clubs"},
        {"cards/004.wav", "five five"},
        {"cards/005.wav", "eight of spades four of clubs seven of hearts"},
        {novel + "0880.wav", "he was not an ill disposed young man"},
        {novel + "0930.wav", "he might even have been made amiable himself"}};
    std::vector<Spoken> spoken;
    for (const auto& [name, words] : recordings) {
        spoken.push_back({words, GatewayTest::readRecording(name)});
    }
    return spoken;
}

void addSynthesised(std::vector<Spoken>& spoken) {
    const TestSupport::ScratchDirectory directory;
    const std::string file = directory.path("spoken.wav");
    for (const char* words :
         {"please turn on the light in the kitchen",
          "what is the weather going to be like tomorrow", "send a message to my brother",
          "the train to the city leaves at nine"}) {
        for (const char* voice : {"kal16", "slt", "rms"}) {
            const TestSupport::ChildProcess::Result result =
                TestSupport::ChildProcess::run({"flite", "-voice", voice, "-t", words, "-o", file});
            ASSERT_EQ(0, result.exitStatus) << result.output;
            spoken.push_back({words, GatewayTest::readSound(file)});
        }
    }
}

struct Answer {
    std::string words;
    /** True if decoding began before the sound was complete. */
    bool begunEarly = false;
};

Answer recognise(const Samples& sound, Utterance::Arrival arrival) {
    Utterance utterance(GatewayTest::sharedPool(), arrival);
    constexpr std::size_t PIECE = 1600;
    for (std::size_t i = 0; i < sound.size(); i += PIECE) {
        utterance.add(Samples(&sound[i], &sound[i] + std::min(PIECE, sound.size() - i)));
    }
    Answer answer;
    answer.begunEarly = utterance.getDecodeMs() > 0;
    std::vector<Gateway::Hypothesis> hypotheses;
    EXPECT_EQ(Utterance::Status::DONE, utterance.finish(hypotheses));
    answer.words = hypotheses.empty() ? "" : hypotheses.front().text;
    return answer;
}

/** PocketSphinx as it is, with the whole sound at once. */
class BatchDecoder {
  public:
    BatchDecoder() {
        cmd_ln_t* configuration = Gateway::SpeechModel().createConfiguration();
        decoder = ps_init(configuration);
        cmd_ln_free_r(configuration);
    }
    ~BatchDecoder() { ps_free(decoder); }
    BatchDecoder(const BatchDecoder&) = delete;
    BatchDecoder& operator=(const BatchDecoder&) = delete;

    std::string recognise(const Samples& sound) const {
        ps_start_stream(decoder);
        ps_start_utt(decoder);
        ps_process_raw(decoder, sound.data(), sound.size(), FALSE, TRUE);
        ps_end_utt(decoder);
        int32 score = 0;
        const char* words = ps_get_hyp(decoder, &score);
        return words == nullptr ? "" : words;
    }

  private:
    ps_decoder_t* decoder;
};

Words split(const std::string& text) {
    std::istringstream stream(text);
    return {std::istream_iterator<std::string>(stream), std::istream_iterator<std::string>()};
}

/** Words to insert, remove or replace in order to turn one text into the other. */
std::size_t countErrors(const Words& expected, const Words& actual) {
    std::vector<std::size_t> row(actual.size() + 1);
    for (std::size_t k = 0; k < row.size(); ++k) {
        row[k] = k;
    }
    for (std::size_t i = 0; i < expected.size(); ++i) {
        std::size_t diagonal = row[0]++;
        for (std::size_t k = 0; k < actual.size(); ++k) {
            const std::size_t replaced = diagonal + (expected[i] == actual[k] ? 0U : 1U);
            diagonal = row[k + 1];
            row[k + 1] = std::min({replaced, row[k] + 1, diagonal + 1});
        }
    }
    return row.back();
}

/** Wrong words by decoding and sound. */
class Tally {
  public:
    void add(const std::string& row, const std::string& expected, const std::string& actual) {
        errors[row] += countErrors(split(expected), split(actual));
    }

    double get(const std::string& row) const { return static_cast<double>(errors.at(row)); }

    void print(std::size_t words) const {
        for (const auto& [row, count] : errors) {
            std::printf("%-16s %3zu of %zu words wrong, %.1f %%\n", row.c_str(), count, words,
                        100.0 * static_cast<double>(count) / static_cast<double>(words));
        }
    }

  private:
    std::map<std::string, std::size_t> errors;
};

}  // namespace

TEST(WordErrorRate, StaysNearBatchDecodingAfterAWait) {
    if (!TestSupport::ChildProcess::isInstalled("flite")) {
        GTEST_SKIP() << "needs the package flite";
    }
    std::vector<Spoken> spoken = collectRecordings();
    addSynthesised(spoken);
    ASSERT_LE(20U, spoken.size());
    const BatchDecoder batch;
    Tally errors;
    std::size_t words = 0;
    for (const Spoken& utterance : spoken) {
        words += split(utterance.words).size();
        const Samples waited = afterAWait(utterance.sound);
        for (const auto& [name, sound] : {std::make_pair(std::string("at once"), &utterance.sound),
                                          std::make_pair(std::string("wait"), &waited)}) {
            const Answer streamed = recognise(*sound, Utterance::Arrival::STREAMED);
            // With little speech, there is no difference; Utterance's own test says so.
            const Answer whole =
                streamed.begunEarly ? recognise(*sound, Utterance::Arrival::WHOLE) : streamed;
            errors.add(name + ", batch", utterance.words, batch.recognise(*sound));
            errors.add(name + ", whole", utterance.words, whole.words);
            errors.add(name + ", streamed", utterance.words, streamed.words);
        }
    }
    errors.print(words);
    for (const std::string arrival : {", whole", ", streamed"}) {
        EXPECT_LE(errors.get("wait" + arrival), 1.15 * errors.get("at once" + arrival)) << arrival;
        for (const std::string begin : {"at once", "wait"}) {
            EXPECT_LE(errors.get(begin + arrival), 1.1 * errors.get(begin + ", batch"))
                << begin << arrival;
        }
    }
}
