/**
 * @file
 * A listener that keeps what it hears.
 */
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <mutex>
#include <string>
#include <vector>

#include "talvox/Recognizer.h"
#include "talvox/RecognizerListener.h"

namespace CloudTest {

/**
 * Keeps the events of recognitions as texts: "recordingBegin", "speakingBegin", "recordingDone",
 * "results", and "error ErrorName"; buffers and levels are kept apart.
 */
class EventRecorder : public Talvox::RecognizerListener {
  public:
    struct Event {
        std::string text;
        int64_t ms = 0; /**< on the platform clock, since the recorder was made */
    };

    EventRecorder();

    void onRecordingBegin(Talvox::Recognizer* recognizer) override;
    void onSpeakingBegin(Talvox::Recognizer* recognizer) override;
    void onRecordingDone(Talvox::Recognizer* recognizer) override;
    void onBufferReceived(Talvox::Recognizer* recognizer,
                          const Sound::SoundDataBuffer& buffer) override;
    void onPowerChanged(Talvox::Recognizer* recognizer, float power) override;
    void onResults(Talvox::Recognizer* recognizer,
                   boost::shared_ptr<Talvox::Recognition> recognition) override;
    void onError(Talvox::Recognizer* recognizer, Talvox::SpeechError error) override;

    /** Waits for `count` ends (results or errors). @return false when they do not come */
    bool waitForEnds(std::size_t count = 1) const;
    bool waitForEnds(std::size_t count, std::chrono::milliseconds timeout) const;

    /** The events but buffers and levels, in order. */
    std::vector<std::string> texts() const;
    /** When the first event of this text came, or -1. */
    int64_t timeOf(const std::string& text) const;
    std::size_t countEnds() const;
    std::size_t countBuffers() const;
    std::vector<float> powers() const;
    boost::shared_ptr<Talvox::Recognition> recognition() const;
    /** What the recognizer said inside the last `onError` about its reason. */
    std::string errorReason() const;

    /**
     * Called at the end of each event, buffers ("buffer") and levels ("power") included, without
     * any lock of this object held. To be set before the events begin.
     */
    std::function<void(const std::string& text, Talvox::Recognizer* recognizer)> hook;

  private:
    void add(const std::string& text, Talvox::Recognizer* recognizer);
    void addEnd(const std::string& text, Talvox::Recognizer* recognizer);
    void append(const std::string& text, std::size_t newEnds);
    void callHook(const std::string& text, Talvox::Recognizer* recognizer) const;

    const int64_t startTime;
    mutable std::mutex mutex;
    mutable std::condition_variable changed;
    std::vector<Event> events;
    std::size_t ends = 0;
    std::size_t buffers = 0;
    std::vector<float> levels;
    boost::shared_ptr<Talvox::Recognition> lastRecognition;
    std::string lastReason;
};

}  // namespace CloudTest
