/**
 * @file
 * A listener that takes no memory.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "talvox/RecognizerListener.h"

namespace TestSupport {

/** Counts the terminal events, without any memory of its own. */
class EndCounter : public Talvox::RecognizerListener {
  public:
    void onRecordingBegin(Talvox::Recognizer* /*recognizer*/) override {}
    void onSpeakingBegin(Talvox::Recognizer* /*recognizer*/) override {}
    void onRecordingDone(Talvox::Recognizer* /*recognizer*/) override {}
    void onBufferReceived(Talvox::Recognizer* /*recognizer*/,
                          const Sound::SoundDataBuffer& /*buffer*/) override {}
    void onPowerChanged(Talvox::Recognizer* /*recognizer*/, float /*power*/) override {}
    void onResults(Talvox::Recognizer* /*recognizer*/,
                   boost::shared_ptr<Talvox::Recognition> /*recognition*/) override {
        ++ends;
    }
    void onError(Talvox::Recognizer* /*recognizer*/, Talvox::SpeechError error) override {
        ++ends;
        code = error.getCode();
    }

    int ends = 0;
    int code = -1;
};

}  // namespace TestSupport
