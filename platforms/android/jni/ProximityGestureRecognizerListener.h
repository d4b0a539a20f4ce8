/**
 * @file
 * Proximity gestures on their way to Java.
 */
#pragma once

#include <jni.h>

#include <boost/shared_ptr.hpp>
#include <string>

#include "Refs.h"
#include "core/sensor/ProximityGestureRecognizer.h"

/** The native side of one Java proximity recognizer. Used under the event lock. */
class ProximityGestureRecognizerListener {
  public:
    /** @param object the Java object that receives the gestures */
    ProximityGestureRecognizerListener(JNIEnv* env, jobject object);
    ProximityGestureRecognizerListener(const ProximityGestureRecognizerListener&) = delete;
    ProximityGestureRecognizerListener& operator=(const ProximityGestureRecognizerListener&) =
        delete;
    ~ProximityGestureRecognizerListener();

    Sensor::ProximityGestureRecognizer& getRecognizer() { return *recognizer; }

    /** Ends the recognition and lets go of the Java object. */
    void detach();

    void onGestureRecognized(const std::string& gesture);

  private:
    Jni::GlobalRef javaObject;
    Jni::GlobalRef javaClass;
    boost::shared_ptr<Sensor::ProximityGestureRecognizer> recognizer;
};
