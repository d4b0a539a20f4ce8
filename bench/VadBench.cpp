// The detectors over speech at 16 kHz in the buffers of a session, next to the bare detector of the
// system's library over the same frames.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <string>
#include <vector>

#include "bench/TestSpeech.h"
#include "core/sound/SoundDataBuffer.h"
#include "libs/webrtc_vad.h"
#include "pal/kd_log.h"
#include "support/BareVad.h"
#include "talvox/impl/VoiceActivityDetector.h"
#include "talvox/impl/VoicePowerEstimator.h"

namespace {

using Clock = std::chrono::steady_clock;
using Detector = boost::shared_ptr<Talvox::VoiceActivityDetector>;

constexpr int RATE = 16000;
constexpr std::size_t SECONDS = 20;
constexpr std::size_t FRAME_SAMPLES = 160;
constexpr std::size_t BUFFER_SAMPLES = 1600;
constexpr int MODE = 2;

const std::vector<int16_t>& speech() {
    static const std::vector<int16_t> samples = Bench::testSpeech(SECONDS);
    return samples;
}

const std::vector<Sound::SoundDataBuffer>& speechBuffers() {
    static const std::vector<Sound::SoundDataBuffer> buffers = [] {
        const Sound::SoundDataInfo info(Sound::SoundDataInfo::NONE, 1, RATE, 2, BUFFER_SAMPLES);
        std::vector<Sound::SoundDataBuffer> cut;
        for (std::size_t begin = 0; begin < speech().size(); begin += BUFFER_SAMPLES) {
            const auto* bytes = reinterpret_cast<const unsigned char*>(speech().data() + begin);
            cut.emplace_back(info, std::vector<unsigned char>(bytes, bytes + BUFFER_SAMPLES * 2));
        }
        return cut;
    }();
    return buffers;
}

/** Creating detectors logs their parameters; benchmarks print results only. */
Detector makeDetector(const std::string& parameters) {
    kdSetLogSinkKOR([](const char* /*message*/, void* /*user*/) {}, nullptr);
    Detector detector = Talvox::VoiceActivityDetector::create(parameters);
    detector->setSoundDataInfo(Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 1, RATE, 2));
    detector->setSessionMode(Sound::Recorder::MODE_VOICE_RECOGNITION);
    detector->start();
    kdSetLogSinkKOR(nullptr, nullptr);
    return detector;
}

int processBare(TestSupport::BareVad& bare) {
    int speechFrames = 0;
    for (std::size_t begin = 0; begin < speech().size(); begin += FRAME_SAMPLES) {
        speechFrames += bare.process(RATE, speech().data() + begin, FRAME_SAMPLES);
    }
    return speechFrames;
}

int processBuffers(Talvox::VoiceActivityDetector& detector) {
    int heard = 0;
    for (const Sound::SoundDataBuffer& buffer : speechBuffers()) {
        detector.process(buffer);
        heard += detector.isSpeech() ? 1 : 0;
    }
    return heard;
}

void countSound(benchmark::State& state) {
    state.counters["sound_s_per_cpu_s"] =
        benchmark::Counter(static_cast<double>(state.iterations()) * static_cast<double>(SECONDS),
                           benchmark::Counter::kIsRate);
}

void bareDetector(benchmark::State& state) {
    TestSupport::BareVad bare(MODE);
    for ([[maybe_unused]] auto _ : state) {
        benchmark::DoNotOptimize(processBare(bare));
    }
    countSound(state);
}
BENCHMARK(bareDetector)->Unit(benchmark::kMillisecond);

void ownLibrary(benchmark::State& state) {
    VadInst* handle = nullptr;
    WebRtcVad_Create(&handle);
    WebRtcVad_Init(handle);
    WebRtcVad_set_mode(handle, MODE);
    for ([[maybe_unused]] auto _ : state) {
        for (std::size_t begin = 0; begin < speech().size(); begin += FRAME_SAMPLES) {
            benchmark::DoNotOptimize(
                WebRtcVad_Process(handle, RATE, speech().data() + begin, FRAME_SAMPLES));
        }
    }
    WebRtcVad_Free(handle);
    countSound(state);
}
BENCHMARK(ownLibrary)->Unit(benchmark::kMillisecond);

void detector(benchmark::State& state, const std::string& parameters) {
    const Detector subject = makeDetector(parameters);
    for ([[maybe_unused]] auto _ : state) {
        benchmark::DoNotOptimize(processBuffers(*subject));
    }
    countSound(state);
}
BENCHMARK_CAPTURE(detector, buffered, "")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(detector, lone, "engine=wrtc")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(detector, history_of_8_megabytes, "analyzems=671088640")
    ->Unit(benchmark::kMillisecond);

void soundLevel(benchmark::State& state) {
    Talvox::VoicePowerEstimator estimator;
    estimator.setMode(1);
    for ([[maybe_unused]] auto _ : state) {
        for (const Sound::SoundDataBuffer& buffer : speechBuffers()) {
            estimator.updatePower(buffer);
        }
        benchmark::DoNotOptimize(estimator.getLevel());
    }
    countSound(state);
}
BENCHMARK(soundLevel)->Unit(benchmark::kMillisecond);

/**
 * Both by turns in the same loop, so that a busy machine slows both alike; compared by the fastest
 * turn of each.
 */
void bufferedAgainstBare(benchmark::State& state) {
    constexpr double LIMIT = 1.10;
    TestSupport::BareVad bare(MODE);
    const Detector buffered = makeDetector("");
    Clock::duration fastestBare = Clock::duration::max();
    Clock::duration fastestBuffered = Clock::duration::max();
    for ([[maybe_unused]] auto _ : state) {
        const Clock::time_point begin = Clock::now();
        benchmark::DoNotOptimize(processBare(bare));
        const Clock::time_point between = Clock::now();
        benchmark::DoNotOptimize(processBuffers(*buffered));
        fastestBare = std::min(fastestBare, between - begin);
        fastestBuffered = std::min(fastestBuffered, Clock::now() - between);
    }
    const double ratio =
        static_cast<double>(fastestBuffered.count()) / static_cast<double>(fastestBare.count());
    state.counters["times_bare"] = ratio;
    state.SetLabel(ratio <= LIMIT ? "within the limit of 1.10" : "BEYOND the limit of 1.10");
}
BENCHMARK(bufferedAgainstBare)->Unit(benchmark::kMillisecond)->MinTime(2.0);

}  // namespace
