/**
 * @file
 * Recording through Java.
 */
#pragma once

#include <jni.h>

#include "../Refs.h"
#include "core/sound/QueuedRecorder.h"

/** Records with `korvel.core.AudioRecorderBackend`, whose thread hands the sound over. */
class AudioRecordRecorder : public Sound::QueuedRecorder {
  public:
    AudioRecordRecorder();
    ~AudioRecordRecorder() override;

    /** Makes this the platform's kind of recorder.
     * @throw Jni::PendingException when its Java class is missing */
    static void install(JNIEnv* env);

  protected:
    bool openDevice(const Sound::RecorderFormat& format,
                    const boost::shared_ptr<Sound::CaptureQueue>& target) override;
    void beginDevice() override;
    void endDevice() override;

  private:
    void call(const char* method);

    Jni::GlobalRef backend;
    boost::shared_ptr<Sound::CaptureQueue> output;
    jlong handle = 0;
};
