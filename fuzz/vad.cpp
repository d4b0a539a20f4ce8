/* A line of detector parameters; three bytes of rate, mode and buffer length; a byte per buffer. */
#include <boost/shared_ptr.hpp>
#include <cmath>
#include <cstdint>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "Fuzz.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "support/TestSound.h"
#include "talvox/VadAnalysis.h"
#include "talvox/impl/VoiceActivityDetector.h"
#include "talvox/impl/VoicePowerEstimator.h"

namespace {

using Fuzz::require;
using Sound::SoundDataBuffer;
using Talvox::VadBufferAnalysis;
using Talvox::VoiceActivityDetector;
using TestSupport::AssertCapture;
using TestSupport::LogCapture;
using TestSupport::Samples;

constexpr int RATES[] = {16000, 8000, 32000, 44100, 11025, 8001, 22050, 12345};
constexpr int BUFFERS_MAX = 24;

/** One buffer's sound: the upper half of the byte says of which kind, the lower how loud. */
Samples makeSound(uint8_t byte, std::size_t count) {
    static const Samples speech = TestSupport::makeSpeechLike(16000, 2000);
    const int amplitude = (1 << (byte & 15U)) - 1;
    TestSupport::NoiseSource noise(byte);
    Samples samples(count);
    for (std::size_t i = 0; i < count; ++i) {
        switch (byte >> 4U) {
            case 0:
            case 1:
                samples[i] = static_cast<int16_t>(noise.next() * static_cast<float>(amplitude));
                break;
            case 2:
                samples[i] = static_cast<int16_t>(i % 40 < 20 ? amplitude : -amplitude);
                break;
            case 3:
                samples[i] = static_cast<int16_t>(amplitude * 2 - 32768);
                break;
            default:
                samples[i] = speech[(std::size_t{byte} * 125 + i) % speech.size()];
        }
    }
    return samples;
}

/** A buffer of the sound. Those of whole length are made once: making one takes its time. */
SoundDataBuffer makeBuffer(uint8_t byte, std::size_t count, int rate) {
    static std::map<std::pair<uint8_t, int>, SoundDataBuffer> made;
    if (count != static_cast<std::size_t>(rate) / 10) {
        return TestSupport::makeBuffer(makeSound(byte, count), rate);
    }
    const auto key = std::make_pair(byte, rate);
    auto found = made.find(key);
    if (found == made.end()) {
        found = made.emplace(key, TestSupport::makeBuffer(makeSound(byte, count), rate)).first;
    }
    return found->second;
}

/** The detector as a session drives it, next to the analyser, which must find the same. */
class Comparison {
  public:
    Comparison(const std::string& text, int sampleRateHz, Sound::Recorder::Mode mode)
        : rate(sampleRateHz), analyzer(text, rate, mode) {
        detector = VoiceActivityDetector::create(text);
        detector->setSoundDataInfo({Sound::SoundDataInfo::NONE, 1, rate, 2});
        detector->setSessionMode(mode);
        detector->start();
        estimator.setMode(mode);
    }

    void run(const SoundDataBuffer& buffer) {
        const VadBufferAnalysis analysis = analyzer.analyze(buffer);
        require(analysis.startMs == lastMs && analysis.endMs >= lastMs, "buffers follow in time");
        lastMs = analysis.endMs;
        if (analysis.learningNoise) {
            require(!isDetecting, "noise is learnt at the beginning only");
            detector->processNoise(buffer);
            estimator.learnNoise(buffer);
            requireEqual(analysis.level, estimator.getNoiseLevel());
            return;
        }
        isDetecting = true;
        detector->process(buffer);
        estimator.updatePower(buffer);
        requireEqual(analysis.level, estimator.getLevel());
        require(analysis.isSpeech == detector->isSpeech(),
                "the analyser finds what a session does");
        require(std::isnan(analysis.activity) || (analysis.activity >= 0 && analysis.activity <= 1),
                "activity is a share");
        requireOrderedSegments();
    }

  private:
    static void requireEqual(float left, float right) {
        require(left == right || (std::isnan(left) && std::isnan(right)),
                "the analyser's level is a session's");
    }

    void requireOrderedSegments() {
        int64_t last = 0;
        for (const Talvox::VadSegment& segment : analyzer.segments()) {
            require(segment.startMs >= last && segment.endMs >= segment.startMs &&
                        segment.endMs <= lastMs,
                    "stretches of speech follow each other");
            last = segment.endMs;
        }
    }

    const int rate;
    Talvox::VadAnalyzer analyzer;
    boost::shared_ptr<VoiceActivityDetector> detector;
    Talvox::VoicePowerEstimator estimator;
    int64_t lastMs = 0;
    bool isDetecting = false;
};

/** An engine's name that is not known is the one broken invariant that a text may cause. */
void requireExpected(const LogCapture& log, const AssertCapture& asserts) {
    std::size_t unknownEngines = 0;
    for (const std::string& message : log.messages()) {
        unknownEngines += message.find("Unknown engine name for") == 0 ? 1 : 0;
    }
    const std::vector<TestSupport::AssertReport> expected(
        unknownEngines, {"aValue == \"buffered\"", "talvox/impl/BufferedVAD", 174});
    require(asserts.reports() == expected, "only an unknown engine breaks an invariant");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, std::size_t size) {
    const LogCapture log;
    const AssertCapture asserts;
    Fuzz::Input input(data, size);
    const std::string text = input.takeLine();
    const int rate = RATES[input.takeBelow(std::size(RATES))];
    const auto mode = (input.takeByte() & 1U) != 0 ? Sound::Recorder::MODE_GENERAL
                                                   : Sound::Recorder::MODE_VOICE_RECOGNITION;
    const auto odd = static_cast<std::size_t>(input.takeByte());
    const std::size_t count = odd == 0 ? static_cast<std::size_t>(rate) / 10 : odd * 17;
    Comparison comparison(text, rate, mode);
    for (int i = 0; i < BUFFERS_MAX && !input.isEmpty(); ++i) {
        comparison.run(makeBuffer(input.takeByte(), count, rate));
    }
    requireExpected(log, asserts);
    return 0;
}
