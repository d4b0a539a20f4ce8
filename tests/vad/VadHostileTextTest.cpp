#include <gmock/gmock.h>

#include <limits>
#include <string>
#include <vector>

#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "talvox/impl/VoiceActivityDetector.h"
#include "vad/VadTestSupport.h"

/* No text of the "vad" setting and no format may hang or crash a session. The sanitizers watch. */
namespace {

using Sound::SoundDataBuffer;
using Sound::SoundDataInfo;
using Talvox::VoiceActivityDetector;
using TestSupport::AssertCapture;
using TestSupport::LogCapture;

/** Runs a detector over buffers of 100 ms; true when it says speech at the end. */
bool run(const std::string& text, const SoundDataInfo& format, int bufferCount = 10) {
    const auto detector = VoiceActivityDetector::create(text);
    detector->setSoundDataInfo(format);
    detector->setSessionMode(Sound::Recorder::MODE_VOICE_RECOGNITION);
    detector->start();
    TestSupport::NoiseSource noise(11);
    std::vector<unsigned char> bytes(3200);
    for (unsigned char& byte : bytes) {
        byte = static_cast<unsigned char>(static_cast<int>(noise.next() * 127));
    }
    SoundDataInfo info = format;
    info.setSampleCount(1600);
    const SoundDataBuffer buffer(info, bytes);
    detector->processNoise(buffer);
    for (int i = 0; i < bufferCount; ++i) {
        detector->process(buffer);
    }
    return detector->isSpeech();
}

constexpr const char* ABSURD_FRAME_LENGTHS[] = {"0",
                                                "-1",
                                                "-10",
                                                "abc",
                                                "",
                                                "101",
                                                "1000000000",
                                                "2147483647",
                                                "-2147483648",
                                                "134217",
                                                "99999999999999999999"};

TEST(VadHostileText, FrameLengthsThatDoNotFitTheBufferDecideNothing) {
    const LogCapture log;
    for (const std::string value : ABSURD_FRAME_LENGTHS) {
        EXPECT_FALSE(run("framems=" + value, TestSupport::monoFormat(16000))) << value;
        EXPECT_FALSE(run("engine=wrtc;framems=" + value, TestSupport::monoFormat(16000))) << value;
    }
}

TEST(VadHostileText, AbsurdFrameLengthsAreSurvivedAtEveryRate) {
    const LogCapture log;
    const int most = std::numeric_limits<int>::max();
    for (const int rate : {8000, 11025, 32000, 44100, 48000, 81536, 1, 0, -1, 999, most, -most}) {
        for (const std::string value : ABSURD_FRAME_LENGTHS) {
            run("framems=" + value, TestSupport::monoFormat(rate));
            run("engine=wrtc;framems=" + value, TestSupport::monoFormat(rate));
        }
    }
}

TEST(VadHostileText, WrappedFrameLengthsReadNothingBeyondTheFrame) {
    const LogCapture log;
    // Numbers whose sample count wraps around to a real one while the byte count does not.
    int wrapped = 0;
    for (unsigned frameMs = 1; frameMs < 3000000000U && wrapped < 200; frameMs += 10007U) {
        const unsigned samples = static_cast<uint16_t>(frameMs * 16000U / 1000U);
        const unsigned bytes = frameMs * 32000U / 1000U;
        if (samples * 2 > bytes && bytes > 0 && bytes < 3200) {
            ++wrapped;
            EXPECT_TRUE(run("engine=wrtc;framems=" + std::to_string(static_cast<int>(frameMs)),
                            TestSupport::monoFormat(16000), 1));
        }
    }
    EXPECT_GT(wrapped, 0);
}

TEST(VadHostileText, UnsupportedFrameLengthsCountAsSpeech) {
    const LogCapture log;
    EXPECT_TRUE(run("framems=15", TestSupport::monoFormat(16000)));
    EXPECT_TRUE(run("framems=1", TestSupport::monoFormat(16000)));
    EXPECT_TRUE(run("framems=40", TestSupport::monoFormat(16000)));
}

TEST(VadHostileText, SpansOfAnyLengthAreSurvived) {
    const LogCapture log;
    for (const char* name : {"analyzems", "analyzemson", "analyzemsoff", "minvoicetimems"}) {
        for (const char* value : {"0", "1", "9", "-1", "x", "2147483647", "-2147483648"}) {
            run(std::string(name) + "=" + value, TestSupport::monoFormat(16000), 3);
        }
    }
}

TEST(VadHostileText, ThresholdsOfAnyKindAreSurvived) {
    const LogCapture log;
    for (const char* name : {"activityon", "activityoff"}) {
        for (const char* value : {"nan", "inf", "-inf", "1e39", "-1", "0x10", "", "%f", "1e"}) {
            run(std::string(name) + "=" + value, TestSupport::monoFormat(16000), 20);
        }
    }
}

TEST(VadHostileText, LibraryParametersOfAnyValueAreSurvived) {
    const LogCapture log;
    for (const char* name :
         {"aggressiveness", "individual", "total", "overhangmax1", "overhangmax2"}) {
        for (const char* value : {"-1", "4", "32767", "-32768", "65538", "2147483647"}) {
            run(std::string(name) + "=" + value, TestSupport::monoFormat(16000), 20);
        }
    }
}

TEST(VadHostileText, RandomTextsAreSurvived) {
    const LogCapture log;
    AssertCapture asserts;
    const std::vector<std::string> pieces = {
        "engine",     "=",       ";",    "_",        " ",     "buffered",     "wrtc", "subengine",
        "framems",    "analyze", "ms",   "on",       "-",     "20",           "1",    "9999999999",
        "activityon", "0.1",     "%s%n", "\xff\xfe", "total", "verboselog=2", "10"};
    TestSupport::NoiseSource noise(17);
    for (int i = 0; i < 500; ++i) {
        std::string text;
        const int length = static_cast<int>((noise.next() + 1) * 12);
        for (int j = 0; j < length; ++j) {
            const auto index = static_cast<std::size_t>((noise.next() + 1) * 0.5F *
                                                        static_cast<float>(pieces.size()));
            text += pieces[index % pieces.size()];
        }
        run(text, TestSupport::monoFormat(16000), 2);
    }
}

TEST(VadHostileText, FormatsOfAnyKindAreSurvived) {
    const LogCapture log;
    AssertCapture asserts;
    for (const int channels : {-1, 0, 1, 2, 65536, std::numeric_limits<int>::max()}) {
        for (const int sampleSize : {-1, 0, 1, 2, 4, std::numeric_limits<int>::max()}) {
            for (const int rate : {0, 8000, 16000, 1000000}) {
                for (const char* engine : {"buffered", "wrtc"}) {
                    run(std::string("engine=") + engine,
                        SoundDataInfo(SoundDataInfo::NONE, channels, rate, sampleSize), 2);
                }
            }
        }
    }
}

TEST(VadHostileText, BuffersOfAnyLengthAreSurvived) {
    const LogCapture log;
    for (const char* text : {"", "engine=wrtc", "analyzemson=50;analyzemsoff=50"}) {
        const auto detector = VoiceActivityDetector::create(text);
        detector->setSoundDataInfo(TestSupport::monoFormat(16000));
        detector->start();
        for (std::size_t length = 0; length < 3300; length += 7) {
            const SoundDataBuffer buffer(SoundDataInfo(SoundDataInfo::NONE, 1, 16000, 2, 1000000),
                                         std::vector<unsigned char>(length, 0));
            detector->processNoise(buffer);
            detector->process(buffer);
        }
        EXPECT_FALSE(detector->isSpeech());
    }
}

}  // namespace
