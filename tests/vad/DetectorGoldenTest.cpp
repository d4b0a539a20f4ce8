/**
 * @file
 * The detector's decisions, compared with a table from Debian's static archive of the core. Builds
 * with another core, or for another architecture, have to decide the same on every frame.
 *
 * The sound is made with integers alone, so that each machine makes the same.
 */
#include <gtest/gtest.h>

#include <array>
#include <boost/crc.hpp>
#include <cstdint>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "libs/webrtc_vad.h"

namespace {

constexpr int FRAMES_PER_FORMAT = 3400;  // in nine formats, so 30,600 frames for each setting

struct Format {
    int16_t rateHz;
    int16_t frameMs;
};

struct Setting {
    const char* name;
    int16_t mode;
    bool isFineGrained;
    WebRtc_ModeParams params;
};

constexpr std::array<Format, 9> FORMATS = {{{8000, 10},
                                            {8000, 20},
                                            {8000, 30},
                                            {16000, 10},
                                            {16000, 20},
                                            {16000, 30},
                                            {32000, 10},
                                            {32000, 20},
                                            {32000, 30}}};

constexpr std::array<Setting, 7> SETTINGS = {{{"mode 0", 0, false, {}},
                                              {"mode 1", 1, false, {}},
                                              {"mode 2", 2, false, {}},
                                              {"mode 3", 3, false, {}},
                                              {"fine 12/30/2/4", 0, true, {12, 30, 2, 4}},
                                              {"fine 60/150/10/20", 2, true, {60, 150, 10, 20}},
                                              {"fine 80/400/1/2", 3, true, {80, 400, 1, 2}}}};

/**
 * Syllables of a triangle wave with a moving pitch and a moving formant, louder and softer, with
 * pauses, over a floor of noise that changes every few seconds.
 */
class IntegerSpeech {
  public:
    explicit IntegerSpeech(int rateHz) : rate(static_cast<uint32_t>(rateHz)) {}

    int16_t next() {
        const uint32_t ms = count / (rate / 1000);
        ++count;
        const uint32_t pitchHz = 110 + (ms / 7) % 90;
        const uint32_t formantHz = 400 + (ms * 3) % 1900;
        phase += pitchHz * (UINT32_MAX / rate);
        formantPhase += formantHz * (UINT32_MAX / rate);
        const bool isPause = ms % 2900 > 1900;
        const int32_t syllable = isPause ? 0 : triangle(ms * (UINT32_MAX / 240)) + 128;
        const auto loudness = static_cast<int32_t>(4 + (ms / 2900) % 29);
        const int32_t voice = (triangle(phase) * 2 + triangle(formantPhase)) * syllable / 256;
        const auto floor = static_cast<int32_t>(2 + (ms / 5300) % 11 * 6);
        return static_cast<int16_t>(voice * loudness + noise() * floor / 6);
    }

  private:
    /** Between -128 and 127. */
    static int32_t triangle(uint32_t at) {
        const auto step = static_cast<int32_t>(at >> 23);
        return step < 256 ? step - 128 : 383 - step;
    }

    /** Between -128 and 127. */
    int32_t noise() {
        state = state * 1664525U + 1013904223U;
        return static_cast<int32_t>(state >> 24) - 128;
    }

    const uint32_t rate;
    uint32_t count = 0;
    uint32_t phase = 0;
    uint32_t formantPhase = 0;
    uint32_t state = 1;
};

std::vector<int16_t> makeSound(const Format& format) {
    IntegerSpeech speech(format.rateHz);
    std::vector<int16_t> samples(
        static_cast<std::size_t>(format.rateHz / 1000 * format.frameMs * FRAMES_PER_FORMAT));
    for (int16_t& sample : samples) {
        sample = speech.next();
    }
    return samples;
}

/** One line: the format, the setting, how many frames are speech, a check sum of all decisions. */
std::string describe(const Format& format, const Setting& setting,
                     const std::vector<int16_t>& sound) {
    VadInst* vad = nullptr;
    EXPECT_EQ(0, WebRtcVad_Create(&vad));
    EXPECT_EQ(0, WebRtcVad_Init(vad));
    EXPECT_EQ(0, WebRtcVad_set_mode(vad, setting.mode));
    if (setting.isFineGrained) {
        EXPECT_EQ(0, WebRtcVad_set_mode_fine_grained(vad, &setting.params));
    }
    const std::size_t length = sound.size() / FRAMES_PER_FORMAT;
    boost::crc_32_type sum;
    int speechFrames = 0;
    for (std::size_t begin = 0; begin < sound.size(); begin += length) {
        const int16_t decision = WebRtcVad_Process(vad, format.rateHz, sound.data() + begin,
                                                   static_cast<int16_t>(length));
        EXPECT_TRUE(decision == 0 || decision == 1);
        sum.process_byte(static_cast<unsigned char>(decision));
        speechFrames += decision;
    }
    WebRtcVad_Free(vad);
    std::array<char, 128> line = {};
    std::snprintf(line.data(), line.size(), "%d Hz, %d ms, %s: %d of %d frames, %08x\n",
                  format.rateHz, format.frameMs, setting.name, speechFrames, FRAMES_PER_FORMAT,
                  static_cast<unsigned>(sum.checksum()));
    return line.data();
}

}  // namespace

TEST(DetectorGolden, DecidesAsTheReferenceDoes) {
    std::string table;
    for (const Format& format : FORMATS) {
        const std::vector<int16_t> sound = makeSound(format);
        for (const Setting& setting : SETTINGS) {
            table += describe(format, setting, sound);
        }
    }
    std::ifstream file(DETECTOR_TABLE);
    const std::string reference(std::istreambuf_iterator<char>(file), {});
    EXPECT_EQ(reference, table) << "the table to be: \n" << table;
}
