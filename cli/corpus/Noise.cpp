#include "Noise.h"

#include <algorithm>
#include <array>
#include <stdexcept>

namespace Cli {

namespace {

const double RATE = WAVE_RATE_HZ;

Wave makeWhite(std::size_t samples, Dice& dice) {
    Wave wave(samples);
    for (double& sample : wave) {
        sample = dice.normal();
    }
    return wave;
}

/** Sums of white noises each of which changes half as often as the one before. */
Wave makePink(std::size_t samples, Dice& dice) {
    const std::size_t ROWS = 12;
    std::array<double, ROWS> rows = {};
    for (double& row : rows) {
        row = dice.normal();
    }
    Wave wave(samples);
    for (std::size_t index = 0; index < samples; ++index) {
        std::size_t row = 0;
        while (row + 1 < ROWS && ((index >> row) & 1U) == 0) {
            ++row;
        }
        rows[row] = dice.normal();
        double sum = dice.normal();
        for (const double value : rows) {
            sum += value;
        }
        wave[index] = sum;
    }
    return wave;
}

/** White noise behind four equal low passes that leave little above 300 Hz, in gusts. */
Wave makeWind(std::size_t samples, Dice& dice) {
    const double SMOOTHING = 0.07;
    std::array<double, 4> stages = {};
    double gain = 0.6;
    double slope = 0;
    std::size_t gustEnd = 0;
    Wave wave(samples);
    for (std::size_t index = 0; index < samples; ++index) {
        if (index == gustEnd) {
            const std::size_t length = WAVE_RATE_HZ / 2 + dice.below(WAVE_RATE_HZ);
            const double target = 0.6 + 0.4 * dice.uniform();
            slope = (target - gain) / static_cast<double>(length);
            gustEnd += length;
        }
        gain += slope;
        double value = dice.normal();
        for (double& stage : stages) {
            stage += SMOOTHING * (value - stage);
            value = stage;
        }
        wave[index] = gain * value;
    }
    return wave;
}

Wave makeHum(std::size_t samples, Dice& dice) {
    const std::array<double, 6> OVERTONES = {1, 0.8, 0.5, 0.4, 0.2, 0.15};
    const std::size_t begin = dice.below(WAVE_RATE_HZ);
    Wave wave(samples);
    for (std::size_t index = 0; index < samples; ++index) {
        double sum = 0;
        for (std::size_t tone = 0; tone < OVERTONES.size(); ++tone) {
            const std::size_t cycles = 50 * (tone + 1) * (begin + index) % WAVE_RATE_HZ;
            sum += OVERTONES[tone] * sineOfTurns(static_cast<double>(cycles) / RATE);
        }
        wave[index] = sum;
    }
    return wave;
}

/** A short noise that rings at a frequency and dies away in a few milliseconds. */
void addClick(Wave& wave, std::size_t begin, double loudness, Dice& dice) {
    const std::size_t LENGTH = WAVE_RATE_HZ / 40;
    const double DECAY = 0.985;
    const double RINGING = 0.9;
    const double frequencyHz = 2000 + 600 * dice.uniform();
    const double feedback = 2 * RINGING * sineOfTurns(frequencyHz / RATE + 0.25);
    double last = 0;
    double secondLast = 0;
    double force = loudness;
    const std::size_t end = std::min(wave.size(), begin + LENGTH);
    for (std::size_t index = begin; index < end; ++index) {
        const double value =
            force * dice.uniform() + feedback * last - RINGING * RINGING * secondLast;
        secondLast = last;
        last = value;
        wave[index] += value;
        force *= DECAY;
    }
}

/** Keys that are pressed, and released with a softer click, 3 to 9 times a second. */
Wave makeClicks(std::size_t samples, Dice& dice) {
    const auto toSampleCount = [](std::size_t ms) { return ms * WAVE_RATE_HZ / 1000; };
    Wave wave(samples);
    std::size_t place = toSampleCount(dice.below(150));
    while (place < samples) {
        addClick(wave, place, 0.7 + 0.3 * dice.uniform(), dice);
        addClick(wave, place + toSampleCount(60 + dice.below(50)), 0.3, dice);
        place += toSampleCount(110 + dice.below(240));
    }
    return wave;
}

/** Chords of three notes with overtones; each is struck and dies away. */
Wave makeTones(std::size_t samples, Dice& dice) {
    const std::array<double, 8> NOTES_HZ = {220, 246.94, 261.63, 293.66, 329.63, 392, 440, 523.25};
    const std::array<double, 4> OVERTONES = {1, 0.5, 0.3, 0.15};
    const std::size_t LENGTH = WAVE_RATE_HZ / 2;
    const double ATTACK = 160;
    const double DECAY = 0.99985;
    std::array<double, 3> notesHz = {};
    double loudness = 0;
    Wave wave(samples);
    for (std::size_t index = 0; index < samples; ++index) {
        const std::size_t place = index % LENGTH;
        if (place == 0) {
            loudness = 1;
            for (double& note : notesHz) {
                note = NOTES_HZ[dice.below(NOTES_HZ.size())];
            }
        }
        const double attack = std::min(1.0, static_cast<double>(place) / ATTACK);
        double sum = 0;
        for (const double note : notesHz) {
            for (std::size_t tone = 0; tone < OVERTONES.size(); ++tone) {
                const double turns = note * static_cast<double>((tone + 1) * place) / RATE;
                sum += OVERTONES[tone] * sineOfTurns(turns);
            }
        }
        wave[index] = attack * loudness * sum;
        loudness *= DECAY;
    }
    return wave;
}

}  // namespace

const std::vector<std::string>& formulaNoises() {
    static const std::vector<std::string> names = {"white", "pink",   "wind",
                                                   "hum",   "clicks", "tones"};
    return names;
}

Wave makeNoise(const std::string& kind, std::size_t samples, Dice dice) {
    if (kind == "white") {
        return makeWhite(samples, dice);
    }
    if (kind == "pink") {
        return makePink(samples, dice);
    }
    if (kind == "wind") {
        return makeWind(samples, dice);
    }
    if (kind == "hum") {
        return makeHum(samples, dice);
    }
    if (kind == "clicks") {
        return makeClicks(samples, dice);
    }
    if (kind == "tones") {
        return makeTones(samples, dice);
    }
    throw std::invalid_argument("no formula for the noise " + kind);
}

}  // namespace Cli
