// What a whole session costs from the recorder's buffer to the encoded bytes, next to the sum of
// the bare detector and the bare Speex encoder on the same sound; heap allocations for each buffer
// on its way from a device's thread to the server; resident memory of an idle engine.
#include <speex/speex.h>

#include <algorithm>
#include <boost/make_shared.hpp>
#include <condition_variable>
#include <cstdio>
#include <cstring>
#include <mutex>
#include <string>
#include <vector>

#include "bench/BenchRecorder.h"
#include "bench/ProcessCost.h"
#include "bench/TestSpeech.h"
#include "libs/webrtc_vad.h"
#include "pal/kd.h"
#include "support/StreamedSession.h"
#include "talvox/RecognizerListenerAdapter.h"
#include "talvox/Talvox.h"

namespace {

constexpr std::size_t BUFFER_SAMPLES = 1600;
constexpr std::size_t BUFFERS = 190;  // below the limit of 20 seconds of sound
constexpr int ROUNDS = 15;
constexpr int QUALITY = 8;

/** Waits for the log line that says that the whole utterance has been encoded. */
class EncodedSignal {
  public:
    EncodedSignal() { kdSetLogSinkKOR(&EncodedSignal::onMessage, this); }
    ~EncodedSignal() { kdSetLogSinkKOR(nullptr, nullptr); }
    EncodedSignal(const EncodedSignal&) = delete;
    EncodedSignal& operator=(const EncodedSignal&) = delete;

    void wait() {
        std::unique_lock<std::mutex> lock(mutex);
        arrived.wait(lock, [this] { return encoded; });
        encoded = false;
    }

  private:
    static void onMessage(const char* message, void* user) {
        if (std::strstr(message, "ParallelEncoder calls back with") == nullptr) {
            return;
        }
        auto* self = static_cast<EncodedSignal*>(user);
        const std::lock_guard<std::mutex> lock(self->mutex);
        self->encoded = true;
        self->arrived.notify_one();
    }

    std::mutex mutex;
    std::condition_variable arrived;
    bool encoded = false;
};

boost::shared_ptr<Talvox::Settings> sessionSettings() {
    auto settings = boost::make_shared<Talvox::Settings>();
    // Nothing listens there; the session is cancelled before its request matters.
    settings->putString(Talvox::Settings::SKS_URL, "http://127.0.0.1:9");
    settings->putString(Talvox::Settings::SKS_UUID, "0123456789abcdef0123456789abcdef");
    settings->putString(Talvox::Settings::SKS_SOUND_FORMAT, Talvox::Settings::SOUND_FORMAT_SPEEX);
    settings->putInt(Talvox::Settings::SKS_SPEEX_QUALITY, QUALITY);
    settings->putInt(Talvox::Settings::SKS_VERBOSE_LEVEL, 2);
    settings->putString(Talvox::Settings::SKS_VAD_SETTINGS, "activityoff=0");
    return settings;
}

double runSession(const std::vector<int16_t>& speech, EncodedSignal& encoded) {
    auto& engine = Talvox::Talvox::getInstance();
    const auto listener = boost::make_shared<Talvox::RecognizerListenerAdapter>();
    const auto recognizer = engine.createRecognizer(listener, engine.getTalvoxSettings());
    const double begin = Bench::processCpuMs();
    recognizer->start();
    for (std::size_t i = 0; i < BUFFERS; ++i) {
        Bench::BenchRecorder::current()->deliver(speech.data() + i * BUFFER_SAMPLES,
                                                 BUFFER_SAMPLES);
        kdAdvanceClockKOR(100LL * 1000 * 1000);
    }
    recognizer->stop();
    encoded.wait();
    const double cpuMs = Bench::processCpuMs() - begin;
    recognizer->cancel();
    return cpuMs;
}

double runBareDetector(const std::vector<int16_t>& speech) {
    const double begin = Bench::processCpuMs();
    VadInst* detector = nullptr;
    WebRtcVad_Create(&detector);
    WebRtcVad_Init(detector);
    WebRtcVad_set_mode(detector, 2);
    for (std::size_t i = 0; i + 160 <= BUFFERS * BUFFER_SAMPLES; i += 160) {
        WebRtcVad_Process(detector, 16000, speech.data() + i, 160);
    }
    WebRtcVad_Free(detector);
    return Bench::processCpuMs() - begin;
}

double runBareSpeex(const std::vector<int16_t>& speech) {
    const double begin = Bench::processCpuMs();
    void* encoder = speex_encoder_init(speex_lib_get_mode(SPEEX_MODEID_WB));
    int quality = QUALITY;
    speex_encoder_ctl(encoder, SPEEX_SET_QUALITY, &quality);
    SpeexBits bits;
    speex_bits_init(&bits);
    std::vector<int16_t> frame(320);
    char packet[512];
    for (std::size_t i = 0; i + 320 <= BUFFERS * BUFFER_SAMPLES; i += 320) {
        std::copy_n(speech.begin() + static_cast<std::ptrdiff_t>(i), 320, frame.begin());
        speex_bits_reset(&bits);
        speex_encode_int(encoder, frame.data(), &bits);
        speex_bits_write(&bits, packet, sizeof(packet));
    }
    speex_bits_destroy(&bits);
    speex_encoder_destroy(encoder);
    return Bench::processCpuMs() - begin;
}

double median(std::vector<double> values) {
    std::sort(values.begin(), values.end());
    return values[values.size() / 2];
}

void printAllocations(const char* what, const std::vector<int16_t>& speech,
                      const std::string& soundFormat) {
    using TestSupport::BUFFER_ALLOCATIONS_MAX;
    const TestSupport::BufferAllocations counts =
        TestSupport::measureBufferAllocations(speech, soundFormat);
    std::printf("heap allocations per 100 ms buffer, %s\n", what);
    std::printf("  all                              %8.2f  (wanted: at most %.0f)\n", counts.all,
                BUFFER_ALLOCATIONS_MAX.all);
    std::printf("  on the audio thread              %8.2f  (wanted: %.0f)\n", counts.onAudioThread,
                BUFFER_ALLOCATIONS_MAX.onAudioThread);
    std::printf("  under the event lock             %8.2f  (wanted: at most %.0f)\n",
                counts.underEventLock, BUFFER_ALLOCATIONS_MAX.underEventLock);
}

}  // namespace

int main() {
    const long before = Bench::residentKiB();
    Talvox::Talvox::getInstance().setTalvoxSettings(sessionSettings());
    const long idle = Bench::residentKiB();

    kdUseManualClockKOR(0);
    EncodedSignal encoded;
    Bench::BenchRecorder::install();
    const std::vector<int16_t> speech = Bench::testSpeech(20);

    std::vector<double> detector;
    std::vector<double> speex;
    std::vector<double> session;
    std::vector<double> ratio;
    for (int i = 0; i < ROUNDS; ++i) {
        detector.push_back(runBareDetector(speech));
        speex.push_back(runBareSpeex(speech));
        session.push_back(runSession(speech, encoded));
        ratio.push_back(session.back() / (detector.back() + speex.back()));
    }
    const double seconds = static_cast<double>(BUFFERS * BUFFER_SAMPLES) / 16000;
    std::printf("%.1f s of 16 kHz speech, CPU milliseconds, medians of %d rounds\n", seconds,
                ROUNDS);
    std::printf("  baseline: bare detector          %8.2f\n", median(detector));
    std::printf("  baseline: bare Speex encoder     %8.2f\n", median(speex));
    std::printf(
        "  session, recorder to bytes       %8.2f  (%.3f of the baselines' sum; wanted: at most "
        "1.05)\n",
        median(session), median(ratio));
    std::printf("  seconds of sound per CPU second  %8.0f\n", seconds * 1000 / median(session));
    std::printf("resident memory, KiB               %8ld before, %ld with an idle engine\n", before,
                idle);
    printAllocations("chunked Speex", speech, Talvox::Settings::SOUND_FORMAT_SPEEX);
    printAllocations("chunked PCM", speech, Talvox::Settings::SOUND_FORMAT_PCM);
    return 0;
}
