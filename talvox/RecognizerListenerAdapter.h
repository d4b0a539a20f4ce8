/**
 * @file
 * A listener that hears nothing.
 */
#pragma once

#include "talvox/RecognizerListener.h"

namespace Talvox {

/** Ignores every event; derive from it to override only those that matter. */
class RecognizerListenerAdapter : public RecognizerListener {
  public:
    void onRecordingBegin(Recognizer*) override {}
    void onSpeakingBegin(Recognizer*) override {}
    void onRecordingDone(Recognizer*) override {}
    void onBufferReceived(Recognizer*, const Sound::SoundDataBuffer&) override {}
    void onPowerChanged(Recognizer*, float) override {}
    void onResults(Recognizer*, boost::shared_ptr<Recognition>) override {}
    void onError(Recognizer*, SpeechError) override {}
};

}  // namespace Talvox
