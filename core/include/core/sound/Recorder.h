/**
 * @file
 * Recording interface and its factory.
 */
#pragma once

#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <boost/weak_ptr.hpp>
#include <functional>

#include "core/Export.h"
#include "core/sound/SoundDataBuffer.h"
#include "core/util/ListenerList.h"

namespace Sound {

class Recorder;

/**
 * Hears of recorded sound. Called on the event thread under the event lock.
 *
 * May do: stop or drop the recorder, remove listeners, call any operation of the engine.
 * Must not do: block, throw.
 */
class KORVEL_CORE_API RecorderListener {
  public:
    virtual ~RecorderListener();

    /** One buffer of exactly the asked length (the device's last may be shorter), in order. */
    virtual void onRecorderDataReceived(Recorder* recorder,
                                        boost::shared_ptr<const SoundDataBuffer> buffer) = 0;

    /**
     * Recording failed: the device or its server is gone, permission was refused, or buffers were
     * not taken in time. No further buffer arrives.
     */
    virtual void onRecorderError(Recorder* recorder) = 0;
};

/**
 * Records 16-bit mono sound. Owned by shared pointer; all operations are to be called with the
 * event lock held.
 */
class KORVEL_CORE_API Recorder : public boost::enable_shared_from_this<Recorder> {
  public:
    /** What a recording is for. */
    enum Mode { MODE_GENERAL = 0, MODE_VOICE_RECOGNITION = 1 };
    /** Makes a recorder; called under the event lock. */
    using Factory = std::function<boost::shared_ptr<Recorder>()>;

    Recorder();
    Recorder(const Recorder&) = delete;
    Recorder& operator=(const Recorder&) = delete;
    virtual ~Recorder();

    /**
     * Prepares the device with the values set so far. Never waits for the device or its server:
     * what only they can tell (no server, no microphone, refused) arrives as `onRecorderError`,
     * after `startRecording` at the earliest.
     * @return false when it is clear at once that recording is not possible (an absurd rate or
     *         buffer length, no kind of recorder); the recorder is of no further use then.
     */
    virtual bool init() = 0;

    /** Begins to deliver buffers. An override calls this base operation last. */
    virtual void startRecording();

    /**
     * Ends recording at once: no listener is called afterwards, except that an error that is being
     * reported reaches every listener. Never waits for the device. An override calls this base
     * operation last.
     */
    virtual void stopRecording();

    /**
     * A new recorder of the platform's kind, or of the installed factory's; never null. Without
     * any kind at hand its `init` returns false.
     */
    static boost::shared_ptr<Recorder> createRecorder();

    /** Installs what `createRecorder` calls; an empty factory restores the platform's own. */
    static void setFactory(Factory factory);

    /** What the recording is for; a hint to the device. Default: voice recognition. */
    void setMode(Mode value) { mode = value; }
    Mode getMode() const { return mode; }

    /** In Hz. Default 16000. To be set before `init`. */
    void setSampleRate(int sampleRateHz) { sampleRate = sampleRateHz; }
    int getSampleRate() const { return sampleRate; }

    /** In milliseconds. Default 100. To be set before `init`. */
    void setBufferLength(int lengthMs) { bufferLengthMs = lengthMs; }
    int getBufferLength() const { return bufferLengthMs; }

    /** Adds a listener; it is held weakly and called in the order of addition. */
    void addListener(const boost::weak_ptr<RecorderListener>& listener);

    /** Whether buffers are delivered. */
    bool isRecording() const { return recording; }

  protected:
    /**
     * Calls every live listener, on a copy of the list, until one stops the recorder. The recorder
     * survives the calls.
     */
    void notifyData(const boost::shared_ptr<const SoundDataBuffer>& buffer);

    /** Calls every live listener, on a copy of the list. The recorder survives the calls. */
    void notifyError();

  private:
    Util::ListenerList<RecorderListener> listeners;
    int sampleRate = 16000;
    int bufferLengthMs = 100;
    Mode mode = MODE_VOICE_RECOGNITION;
    bool recording = false;
    unsigned stopCount = 0;
};

}  // namespace Sound
