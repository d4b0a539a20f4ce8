/**
 * @file
 * Where near and far come from.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <functional>

#include "core/Export.h"

namespace Sensor {

/** A proximity sensor. Owned by shared pointer; all operations are called under the event lock. */
class KORVEL_CORE_API ProximitySource {
  public:
    /** Told of every sample under the event lock: whether something is near. */
    using Callback = std::function<void(bool isNear)>;
    /** Makes the platform's source; returns null where there is none. */
    using Factory = std::function<boost::shared_ptr<ProximitySource>()>;

    virtual ~ProximitySource();

    /**
     * Begins to deliver samples: the present state as soon as the sensor tells it, then changes
     * (the same state may come repeatedly). Never blocks.
     * @return false when there is no sensor
     */
    virtual bool start(Callback callback) = 0;

    /** Ends the delivery: the callback is not called any more. Never blocks. */
    virtual void stop() = 0;

    /** A new source of the installed factory's kind; null where there is none. */
    static boost::shared_ptr<ProximitySource> createSource();

    /** Installs what `createSource` calls; an empty factory takes it away. */
    static void setFactory(Factory factory);

  protected:
    ProximitySource() = default;
    ProximitySource(const ProximitySource&) = default;
    ProximitySource& operator=(const ProximitySource&) = default;
};

}  // namespace Sensor
