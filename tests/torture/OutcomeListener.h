/**
 * @file
 * A listener that allocates nothing.
 */
#pragma once

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <mutex>

#include "Order.h"
#include "talvox/RecognizerListener.h"

namespace Torture {

/** Notes the outcome of one session. Any thread. */
class OutcomeListener : public Talvox::RecognizerListener {
  public:
    explicit OutcomeListener(SessionOutcome& target);

    void onRecordingBegin(Talvox::Recognizer* recognizer) override;
    void onSpeakingBegin(Talvox::Recognizer* recognizer) override;
    void onRecordingDone(Talvox::Recognizer* recognizer) override;
    void onBufferReceived(Talvox::Recognizer* recognizer,
                          const Sound::SoundDataBuffer& buffer) override;
    void onPowerChanged(Talvox::Recognizer* recognizer, float power) override;
    void onResults(Talvox::Recognizer* recognizer,
                   boost::shared_ptr<Talvox::Recognition> recognition) override;
    void onError(Talvox::Recognizer* recognizer, Talvox::SpeechError error) override;

    /** Waits for a terminal event, in real time. */
    bool waitForEnd(std::chrono::milliseconds limit);

    bool isOver();
    int countBuffers() const { return buffers; }

  private:
    void noteEnd();

    SessionOutcome& outcome;
    const std::int64_t began;
    std::mutex mutex;
    std::condition_variable changed;
    std::atomic<int> buffers{0};
};

}  // namespace Torture
