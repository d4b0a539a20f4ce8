#include "Utterance.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <string>

namespace Cli {

namespace {

const std::array<int, 3> PEAKS = {300, 2000, 8000};
const std::array<int, 3> LEADS_MS = {200, 500, 1500};

// Each is drawn as often as any other: two brief pauses, six of medium length, two long ones.
const std::array<int, 10> PAUSES_MS = {100, 150, 200, 300, 400, 500, 700, 900, 1400, 2000};
// So many utterances of ten have a part more than the one before.
const std::size_t TENTHS_WITH_A_SECOND_PART = 7;
const std::size_t TENTHS_WITH_A_THIRD_PART = 4;

/** Sentences in three parts; the first, and the first two, can stand alone. */
const std::vector<std::array<std::string, 3>>& sentences() {
    static const std::vector<std::array<std::string, 3>> all = {
        {"turn on the light", "in the kitchen", "at half past seven"},
        {"send a message", "to my brother", "and tell him that I am late"},
        {"what is the weather", "in the mountains", "on Saturday"},
        {"stop", "the music", "in five minutes"},
        {"show me the way", "to the station", "without the motorway"},
        {"call the office", "of doctor Fisher", "on the mobile phone"},
        {"yes", "please", "do it now"},
        {"put six eggs", "and a bottle of milk", "on the shopping list"},
        {"the meeting begins", "at a quarter past nine", "and ends before lunch"},
        {"next page", "and then", "read it to me"},
        {"she had never seen", "so many birds", "in a single tree"},
        {"write that down", "full stop", "new paragraph"},
        {"half", "of the houses in this street", "are empty in winter"},
        {"find a cheap flight", "from here to Lisbon", "for two people"},
        {"no", "that is not", "what I asked for"},
        {"set the heating", "to twenty one degrees", "until I come home"},
    };
    return all;
}

void addSilence(Wave& wave, int ms) {
    wave.resize(wave.size() + static_cast<std::size_t>(ms) * (WAVE_RATE_HZ / 1000));
}

int64_t lengthMs(const Wave& wave) {
    return static_cast<int64_t>(wave.size()) * 1000 / WAVE_RATE_HZ;
}

void addSpeech(Utterance& utterance, const std::vector<int16_t>& samples, const std::string& text) {
    const int64_t startMs = lengthMs(utterance.wave);
    utterance.wave.insert(utterance.wave.end(), samples.begin(), samples.end());
    utterance.speech.push_back({startMs, lengthMs(utterance.wave), text});
}

void setPeak(Wave& wave, int peak) {
    double highest = 0;
    for (const double sample : wave) {
        highest = std::max(highest, sample < 0 ? -sample : sample);
    }
    if (highest > 0) {
        scale(wave, peak / highest);
    }
}

}  // namespace

Utterance makeUtterance(uint64_t seed, int number, int tailMs, Speaker& speaker) {
    Dice dice(Dice::derive(seed, "utterance " + std::to_string(number)));
    const auto index = static_cast<std::size_t>(number);
    Utterance utterance;
    utterance.voice = Speaker::voices()[dice.below(Speaker::voices().size())];
    utterance.peak = PEAKS[index % PEAKS.size()];
    utterance.leadMs = LEADS_MS[index / PEAKS.size() % LEADS_MS.size()];
    const std::array<std::string, 3>& sentence = sentences()[dice.below(sentences().size())];
    const bool hasSecond = dice.below(10) < TENTHS_WITH_A_SECOND_PART;
    const bool hasThird = dice.below(10) < TENTHS_WITH_A_THIRD_PART;
    const std::size_t parts = hasSecond ? (hasThird ? 3 : 2) : 1;

    addSilence(utterance.wave, utterance.leadMs);
    for (std::size_t part = 0; part < parts; ++part) {
        if (part > 0) {
            addSilence(utterance.wave, PAUSES_MS[dice.below(PAUSES_MS.size())]);
        }
        addSpeech(utterance, speaker.speak(utterance.voice, sentence[part]), sentence[part]);
    }
    addSilence(utterance.wave, tailMs);
    setPeak(utterance.wave, utterance.peak);
    return utterance;
}

Wave makeBabble(std::size_t samples, Dice dice, Speaker& speaker) {
    const int SPEAKERS = 6;
    Wave babble(samples);
    for (int speaking = 0; speaking < SPEAKERS; ++speaking) {
        const std::string voice = Speaker::voices()[dice.below(Speaker::voices().size())];
        std::size_t place = 0;
        // Enter in the middle of a word.
        std::size_t skipped = dice.below(WAVE_RATE_HZ / 2);
        while (place < samples) {
            const std::array<std::string, 3>& sentence =
                sentences()[dice.below(sentences().size())];
            for (const std::string& part : sentence) {
                const std::vector<int16_t>& speech = speaker.speak(voice, part);
                for (std::size_t index = std::min(skipped, speech.size());
                     index < speech.size() && place < samples; ++index) {
                    babble[place++] += speech[index];
                }
                skipped = 0;
            }
        }
    }
    return babble;
}

}  // namespace Cli
