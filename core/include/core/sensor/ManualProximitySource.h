/**
 * @file
 * A proximity sensor without a device.
 */
#pragma once

#include "core/sensor/ProximitySource.h"

namespace Sensor {

/** Delivers what a test or a tool feeds into it. */
class KORVEL_CORE_API ManualProximitySource : public ProximitySource {
  public:
    ManualProximitySource();
    ~ManualProximitySource() override;

    bool start(Callback callback) override;
    void stop() override;

    /** One sample, delivered before this returns; lost while nobody listens. Takes the event lock.
     */
    void feed(bool isNear);

    /** Whether somebody listens. */
    bool isStarted() const { return static_cast<bool>(target); }

  private:
    Callback target;
};

}  // namespace Sensor
