#include "Microphone.h"

#include <boost/make_shared.hpp>
#include <condition_variable>
#include <deque>
#include <mutex>

#include "SoundBuffers.h"
#include "UsageError.h"
#include "core/util/EventLock.h"

namespace Cli {

/** Takes the buffers on the event thread. */
class Microphone::Inbox : public Sound::RecorderListener {
  public:
    void onRecorderDataReceived(Sound::Recorder* /*recorder*/,
                                boost::shared_ptr<const Sound::SoundDataBuffer> buffer) override {
        const std::lock_guard<std::mutex> lock(mutex_);
        buffers_.push_back(std::move(buffer));
        changed_.notify_one();
    }

    void onRecorderError(Sound::Recorder* /*recorder*/) override {
        const std::lock_guard<std::mutex> lock(mutex_);
        failed_ = true;
        changed_.notify_one();
    }

    boost::shared_ptr<const Sound::SoundDataBuffer> take() {
        std::unique_lock<std::mutex> lock(mutex_);
        changed_.wait(lock, [this] { return interrupted_ || failed_ || !buffers_.empty(); });
        if (interrupted_ || buffers_.empty()) {
            return nullptr;
        }
        boost::shared_ptr<const Sound::SoundDataBuffer> buffer = std::move(buffers_.front());
        buffers_.pop_front();
        return buffer;
    }

    void interrupt() {
        const std::lock_guard<std::mutex> lock(mutex_);
        interrupted_ = true;
        changed_.notify_one();
    }

    bool hasFailed() const {
        const std::lock_guard<std::mutex> lock(mutex_);
        return failed_;
    }

  private:
    mutable std::mutex mutex_;
    std::condition_variable changed_;
    std::deque<boost::shared_ptr<const Sound::SoundDataBuffer>> buffers_;
    bool interrupted_ = false;
    bool failed_ = false;
};

Microphone::Microphone(int sampleRateHz, Sound::Recorder::Mode mode)
    : inbox_(boost::make_shared<Inbox>()) {
    const Util::EventLock lock;
    recorder_ = Sound::Recorder::createRecorder();
    recorder_->setMode(mode);
    recorder_->setSampleRate(sampleRateHz);
    recorder_->setBufferLength(BUFFER_MS);
    recorder_->addListener(inbox_);
    if (!recorder_->init()) {
        throw UsageError("recording is not possible here");
    }
    recorder_->startRecording();
}

Microphone::~Microphone() {
    const Util::EventLock lock;
    recorder_->stopRecording();
    recorder_.reset();
}

boost::shared_ptr<const Sound::SoundDataBuffer> Microphone::take() {
    return inbox_->take();
}

void Microphone::interrupt() {
    inbox_->interrupt();
}

bool Microphone::hasFailed() const {
    return inbox_->hasFailed();
}

}  // namespace Cli
