/**
 * @file
 * What happens in the application, and whether anything happens too late.
 */
#pragma once

#include <atomic>
#include <mutex>
#include <string>
#include <vector>

#include "talvox/RecognizerListener.h"

namespace TearDown {

/** Keeps texts. A static object of the application, as the callbacks of a real one use them. */
class Journal {
  public:
    Journal() = default;
    ~Journal() { gone() = true; }
    Journal(const Journal&) = delete;
    Journal& operator=(const Journal&) = delete;

    /** Whatever comes after the end of the application's objects is said aloud. */
    void add(const std::string& text);

  private:
    /** Survives the object: it needs no destructor. */
    static std::atomic<bool>& gone();

    std::mutex mutex;
    std::vector<std::string> texts;
};

/** Writes every event into a journal. */
class JournalListener : public Talvox::RecognizerListener {
  public:
    explicit JournalListener(Journal& target) : journal(target) {}

    /** From now on an event is one too many. */
    void expectNothing() { silent = true; }
    int countUnexpected() const { return unexpected; }

    void onRecordingBegin(Talvox::Recognizer* recognizer) override;
    void onSpeakingBegin(Talvox::Recognizer* recognizer) override;
    void onRecordingDone(Talvox::Recognizer* recognizer) override;
    void onBufferReceived(Talvox::Recognizer* recognizer,
                          const Sound::SoundDataBuffer& buffer) override;
    void onPowerChanged(Talvox::Recognizer* recognizer, float power) override;
    void onResults(Talvox::Recognizer* recognizer,
                   boost::shared_ptr<Talvox::Recognition> recognition) override;
    void onError(Talvox::Recognizer* recognizer, Talvox::SpeechError error) override;

  private:
    void note(const char* text);

    Journal& journal;
    std::atomic<bool> silent{false};
    std::atomic<int> unexpected{0};
};

}  // namespace TearDown
