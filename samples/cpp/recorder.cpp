// A recorder of the application's own, for sound that arrives on one of its threads. A real one
// would be a headset or a connection; this one reads a file of raw 16-bit mono sound at 16 kHz.
// usage: recorder SOUND.raw [GATEWAY]
#include <core/sound/QueuedRecorder.h>

#include <atomic>
#include <chrono>
#include <mutex>
#include <thread>

#include "Session.h"

namespace {

/** Delivers sound on a thread of its own, 20 ms at a time, and silence after the sound's end. */
class Headset {
  public:
    explicit Headset(std::vector<int16_t> sound)
        : samples(std::move(sound)), thread([this] { run(); }) {}
    ~Headset() {
        isRunning = false;
        thread.join();
    }

    /** Null for nobody. Must not wait for the thread: the caller holds the event lock. */
    void connect(const boost::shared_ptr<Sound::CaptureQueue>& queue) {
        const std::lock_guard<std::mutex> lock(mutex);
        listener = queue;
        position = 0;
    }

  private:
    static constexpr std::size_t PIECE = 320;

    void run() {
        for (auto due = std::chrono::steady_clock::now(); isRunning;
             due += std::chrono::milliseconds(20)) {
            std::this_thread::sleep_until(due);
            deliver();
        }
    }

    void deliver() {
        const std::lock_guard<std::mutex> lock(mutex);
        if (!listener) {
            return;
        }
        std::vector<int16_t> piece(PIECE);
        for (int16_t& sample : piece) {
            sample = position < samples.size() ? samples[position++] : int16_t{0};
        }
        listener->push(reinterpret_cast<const unsigned char*>(piece.data()),
                       piece.size() * sizeof(int16_t));
    }

    const std::vector<int16_t> samples;
    std::mutex mutex;
    boost::shared_ptr<Sound::CaptureQueue> listener;
    std::size_t position = 0;
    std::atomic<bool> isRunning{true};
    std::thread thread;  // last: it uses the others
};

/** `QueuedRecorder` cuts the sound into buffers and delivers them on the event thread. */
class HeadsetRecorder : public Sound::QueuedRecorder {
  public:
    explicit HeadsetRecorder(Headset& source)
        : QueuedRecorder("HeadsetRecorder"), headset(source) {}
    ~HeadsetRecorder() override { stopRecording(); }

  protected:
    bool openDevice(const Sound::RecorderFormat&,
                    const boost::shared_ptr<Sound::CaptureQueue>& target) override {
        queue = target;
        return true;
    }
    void beginDevice() override { headset.connect(queue); }
    void endDevice() override { headset.connect(nullptr); }

  private:
    Headset& headset;
    boost::shared_ptr<Sound::CaptureQueue> queue;
};

}  // namespace

int main(int argc, char** argv) {
    if (argc < 2) {
        std::cerr << "usage: recorder SOUND.raw [GATEWAY]" << std::endl;
        return 2;
    }
    Headset headset(readSamples(argv[1]));
    Sound::Recorder::setFactory(
        [&headset] { return boost::make_shared<HeadsetRecorder>(headset); });
    return recognize(argc > 2 ? argv[2] : "http://127.0.0.1:8090");
}
