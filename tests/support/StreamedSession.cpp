#include "support/StreamedSession.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <boost/make_shared.hpp>
#include <boost/scoped_ptr.hpp>
#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <functional>
#include <mutex>
#include <stdexcept>
#include <thread>

#include "core/sound/OggSpeexEncoder.h"
#include "core/sound/QueuedRecorder.h"
#include "pal/kd.h"
#include "support/AllocationCount.h"
#include "support/TestSound.h"
#include "talvox/RecognizerListenerAdapter.h"
#include "talvox/Talvox.h"

namespace TestSupport {

namespace {

constexpr int SAMPLE_RATE = 16000;
constexpr std::size_t BUFFER_SAMPLES = 1600;
constexpr int64_t BUFFER_NS = 100LL * 1000 * 1000;

constexpr std::size_t WARM_UP_BUFFERS = 32;
constexpr std::size_t BUFFERS = 160;
constexpr std::chrono::seconds ARRIVAL_LIMIT{30};

/** Reads one streamed request without any allocation, and answers it. */
class ByteSink {
  public:
    ByteSink() : listener(socket(AF_INET, SOCK_STREAM, 0)) {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof(address);
        auto* const generic = reinterpret_cast<sockaddr*>(&address);
        if (listener < 0 || bind(listener, generic, size) != 0 || listen(listener, 1) != 0 ||
            getsockname(listener, generic, &size) != 0) {
            throw std::runtime_error("cannot listen on loopback");
        }
        port = ntohs(address.sin_port);
        thread = std::thread([this] { serve(); });
    }

    ~ByteSink() {
        shutdown(listener, SHUT_RDWR);
        thread.join();
        close(listener);
    }
    ByteSink(const ByteSink&) = delete;
    ByteSink& operator=(const ByteSink&) = delete;

    int getPort() const { return port; }

    /** Waits until so many bytes have arrived. */
    void waitFor(std::size_t count) {
        std::unique_lock<std::mutex> lock(mutex);
        if (!changed.wait_for(lock, ARRIVAL_LIMIT, [&] { return arrived >= count; })) {
            throw std::runtime_error("the server does not get the sound");
        }
    }

  private:
    void serve() {
        const int connection = accept(listener, nullptr, nullptr);
        char buffer[65536];
        for (ssize_t got = 1; got > 0;) {
            got = recv(connection, buffer, sizeof(buffer), 0);
            const std::lock_guard<std::mutex> lock(mutex);
            arrived += static_cast<std::size_t>(got > 0 ? got : 0);
            changed.notify_all();
        }
        close(connection);
    }

    int listener = -1;
    int port = 0;
    std::mutex mutex;
    std::condition_variable changed;
    std::size_t arrived = 0;
    std::thread thread;
};

/** Records what `feed` gives to its device's thread. */
class FedRecorder : public Sound::QueuedRecorder {
  public:
    FedRecorder() : QueuedRecorder("FedRecorder"), device([this] { run(); }) {}

    ~FedRecorder() override {
        stopRecording();
        {
            const std::lock_guard<std::mutex> lock(mutex);
            ended = true;
        }
        changed.notify_all();
        device.join();
    }

    /** Returns when the device's thread has pushed the sound. */
    void feed(const int16_t* samples) {
        std::unique_lock<std::mutex> lock(mutex);
        next = samples;
        changed.notify_all();
        changed.wait(lock, [this] { return next == nullptr; });
    }

  protected:
    bool openDevice(const Sound::RecorderFormat& /*format*/,
                    const boost::shared_ptr<Sound::CaptureQueue>& captured) override {
        target = captured;
        return true;
    }
    void beginDevice() override {}
    void endDevice() override {}

  private:
    void run() {
        markAudioThread();
        std::unique_lock<std::mutex> lock(mutex);
        for (;;) {
            changed.wait(lock, [this] { return ended || next != nullptr; });
            if (ended) {
                return;
            }
            // As a sound server does: in pieces that fit no buffer.
            constexpr std::size_t PIECE = 600;
            const auto* const bytes = reinterpret_cast<const unsigned char*>(next);
            for (std::size_t done = 0; done < BUFFER_SAMPLES * 2; done += PIECE) {
                target->push(bytes + done, std::min(PIECE, BUFFER_SAMPLES * 2 - done));
            }
            next = nullptr;
            changed.notify_all();
        }
    }

    boost::shared_ptr<Sound::CaptureQueue> target;
    std::mutex mutex;
    std::condition_variable changed;
    const int16_t* next = nullptr;
    bool ended = false;
    std::thread device;
};

boost::shared_ptr<Talvox::Settings> makeSettings(int port, const std::string& soundFormat) {
    auto settings = boost::make_shared<Talvox::Settings>();
    settings->putString(Talvox::Settings::SKS_URL, "http://127.0.0.1:" + std::to_string(port));
    settings->putString(Talvox::Settings::SKS_UUID, "0123456789abcdef0123456789abcdef");
    settings->putString(Talvox::Settings::SKS_SOUND_FORMAT, soundFormat);
    settings->putBoolean(Talvox::Settings::SKS_STREAMING, true);
    // Speech that has begun does not end.
    settings->putString(Talvox::Settings::SKS_VAD_SETTINGS, "activityoff=0");
    return settings;
}

/** Restores what the measurement changes. */
class Surroundings {
  public:
    explicit Surroundings(Sound::Recorder::Factory factory) {
        kdUseManualClockKOR(0);
        Sound::Recorder::setFactory(std::move(factory));
    }
    ~Surroundings() {
        Sound::Recorder::setFactory({});
        kdUseRealClockKOR();
    }
    Surroundings(const Surroundings&) = delete;
    Surroundings& operator=(const Surroundings&) = delete;
};

/**
 * Bytes of sound that the session has sent after each buffer. What the request adds to them is less
 * than a few buffers: the session cannot fall behind by more than that.
 */
std::vector<std::size_t> countSentBytes(const std::vector<int16_t>& speech,
                                        const Talvox::Settings& settings) {
    const bool isSpeex = settings.getString(Talvox::Settings::SKS_SOUND_FORMAT) ==
                         Talvox::Settings::SOUND_FORMAT_SPEEX;
    std::vector<std::size_t> counts;
    std::size_t count = 0;
    boost::scoped_ptr<Sound::OggSpeexEncoder> encoder;
    for (const Sound::SoundDataBuffer& buffer : cutIntoBuffers(speech, SAMPLE_RATE)) {
        if (!isSpeex) {
            count += buffer.getData().size();
        } else {
            if (!encoder) {
                encoder.reset(new Sound::OggSpeexEncoder(
                    buffer.getInfo(), settings.getInt(Talvox::Settings::SKS_SPEEX_QUALITY), 512));
            }
            encoder->encode(buffer);
            count += encoder->takeOutput(-1)->getData().size();
        }
        counts.push_back(count);
    }
    return counts;
}

double perBuffer(uint64_t before, uint64_t after) {
    return static_cast<double>(after - before) / static_cast<double>(BUFFERS - WARM_UP_BUFFERS);
}

}  // namespace

BufferAllocations measureBufferAllocations(const std::vector<int16_t>& speech,
                                           const std::string& soundFormat) {
    ByteSink sink;
    boost::shared_ptr<FedRecorder> recorder;
    const Surroundings surroundings([&recorder] {
        recorder = boost::make_shared<FedRecorder>();
        return recorder;
    });
    auto& engine = Talvox::Talvox::getInstance();
    const auto settings = makeSettings(sink.getPort(), soundFormat);
    engine.setTalvoxSettings(settings);
    const auto listener = boost::make_shared<Talvox::RecognizerListenerAdapter>();
    const auto recognizer = engine.createRecognizer(listener, settings);
    const std::vector<std::size_t> sentBytes = countSentBytes(speech, *settings);
    if (sentBytes.size() < BUFFERS) {
        throw std::runtime_error("too little speech");
    }
    recognizer->start();
    AllocationCounts before;
    for (std::size_t i = 0; i < BUFFERS; ++i) {
        if (i == WARM_UP_BUFFERS) {
            before = countAllocations();
        }
        recorder->feed(speech.data() + i * BUFFER_SAMPLES);
        kdAdvanceClockKOR(BUFFER_NS);
        sink.waitFor(sentBytes[i]);
    }
    const AllocationCounts after = countAllocations();
    recognizer->cancel();
    return {perBuffer(before.all, after.all), perBuffer(before.onAudioThread, after.onAudioThread),
            perBuffer(before.underEventLock, after.underEventLock)};
}

}  // namespace TestSupport
