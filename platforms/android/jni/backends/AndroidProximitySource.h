/**
 * @file
 * The proximity sensor through Java.
 */
#pragma once

#include <jni.h>

#include <boost/enable_shared_from_this.hpp>

#include "../Refs.h"
#include "core/sensor/ProximitySource.h"

/** Listens to `korvel.core.ProximityBackend`. Used under the event lock. */
class AndroidProximitySource : public Sensor::ProximitySource,
                               public boost::enable_shared_from_this<AndroidProximitySource> {
  public:
    AndroidProximitySource() = default;
    AndroidProximitySource(const AndroidProximitySource&) = delete;
    AndroidProximitySource& operator=(const AndroidProximitySource&) = delete;
    ~AndroidProximitySource() override;

    /** Makes this the platform's kind of source.
     * @throw Jni::PendingException when its Java class is missing */
    static void install(JNIEnv* env);

    bool start(Callback callback) override;
    void stop() override;

    /** A sample of the sensor. */
    void onSample(bool isNear);

  private:
    Callback target;
    Jni::GlobalRef backend;
};
