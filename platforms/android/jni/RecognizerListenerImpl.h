/**
 * @file
 * Events of a recognition on their way to Java.
 */
#pragma once

#include <jni.h>

#include <boost/shared_ptr.hpp>

#include "Refs.h"
#include "talvox/Recognizer.h"
#include "talvox/RecognizerListener.h"

/**
 * Forwards every event to a Java recognizer object, and owns the native recognizer for Java. Used
 * under the event lock. What the Java methods throw is logged and cleared. Results that the VM has
 * no room for become `onError` with `ErrorUnknown`.
 */
class RecognizerListenerImpl : public Talvox::RecognizerListener {
  public:
    RecognizerListenerImpl() = default;
    ~RecognizerListenerImpl() override;

    /** @param object the Java recognizer that hears of everything from now on */
    void attach(JNIEnv* env, jobject object);

    /** Lets go of the Java object: nothing more reaches it. */
    void detach();

    void setRecognizer(const boost::shared_ptr<Talvox::Recognizer>& value) { recognizer = value; }
    const boost::shared_ptr<Talvox::Recognizer>& getRecognizer() const { return recognizer; }

    void onRecordingBegin(Talvox::Recognizer* source) override;
    void onSpeakingBegin(Talvox::Recognizer* source) override;
    void onRecordingDone(Talvox::Recognizer* source) override;
    void onBufferReceived(Talvox::Recognizer* source,
                          const Sound::SoundDataBuffer& buffer) override;
    void onPowerChanged(Talvox::Recognizer* source, float power) override;
    void onResults(Talvox::Recognizer* source,
                   boost::shared_ptr<Talvox::Recognition> recognition) override;
    void onError(Talvox::Recognizer* source, Talvox::SpeechError error) override;

  private:
    /** Calls `event(env)` with Java's failures contained. */
    template <typename Event>
    void deliver(const char* name, jint localReferences, Event event);

    /** Hands what is known of the error that follows to a Java object that wants to know it. */
    void reportDetail(const Talvox::Recognizer& source);

    /** Calls a method of exactly the kept class. */
    template <typename... Args>
    void callJava(JNIEnv* env, const char* name, const char* signature, Args... args);

    boost::shared_ptr<Talvox::Recognizer> recognizer;
    Jni::GlobalRef javaObject;
    Jni::GlobalRef javaClass;
};
