/**
 * @file
 * How the application hears of a recognition.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "core/sound/SoundDataBuffer.h"
#include "talvox/Export.h"
#include "talvox/Recognition.h"
#include "talvox/SpeechError.h"

namespace Talvox {

class Recognizer;

/**
 * Events of one recognition, called under the event lock, mostly on the event thread. The
 * application owns the listener; recognizers hold it weakly. The first argument is the recognizer
 * that calls, valid during the call.
 *
 * After at most one `onResults` or `onError` a session is over.
 *
 * May do: stop or cancel the recognizer, add a listener, drop the last reference to the recognizer
 * or to the listener, and, from `onResults` and `onError`, start the next recognizer.
 * Must not: block, wait for another thread that calls the engine, throw, or keep a reference to a
 * sound buffer beyond the call.
 */
class TALVOX_API RecognizerListener {
  public:
    virtual ~RecognizerListener();

    /** Recording runs and the background noise has been learned: the user may speak. */
    virtual void onRecordingBegin(Recognizer* recognizer) = 0;
    /** Speech has been detected. */
    virtual void onSpeakingBegin(Recognizer* recognizer) = 0;
    /** Recording has ended; the answer is awaited. */
    virtual void onRecordingDone(Recognizer* recognizer) = 0;
    /** A buffer of recorded sound. */
    virtual void onBufferReceived(Recognizer* recognizer, const Sound::SoundDataBuffer& buffer) = 0;
    /** A new sound level in decibels. */
    virtual void onPowerChanged(Recognizer* recognizer, float power) = 0;
    /** The end: hypotheses. Each listener gets an object of its own. */
    virtual void onResults(Recognizer* recognizer, boost::shared_ptr<Recognition> recognition) = 0;
    /** The end: an error. */
    virtual void onError(Recognizer* recognizer, SpeechError error) = 0;

  protected:
    RecognizerListener() = default;
    RecognizerListener(const RecognizerListener&) = default;
    RecognizerListener& operator=(const RecognizerListener&) = default;
};

}  // namespace Talvox
