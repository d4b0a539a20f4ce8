#pragma once

#include <boost/shared_ptr.hpp>

#include "EventQueue.h"
#include "pal/kd_types.h"
#include "talvox/RecognizerListener.h"

namespace Cli {

/** Puts the recognizer's events, with their times, into a queue. */
class SessionListener : public Talvox::RecognizerListener {
  public:
    /** Times count from now. */
    explicit SessionListener(boost::shared_ptr<EventQueue> events);

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
    SessionEvent make(SessionEvent::Kind kind) const;

    boost::shared_ptr<EventQueue> queue;
    KDust startTime;
    bool isSilence = false;
};

}  // namespace Cli
