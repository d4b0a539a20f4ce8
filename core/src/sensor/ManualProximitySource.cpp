#include "core/sensor/ManualProximitySource.h"

#include <utility>

#include "core/util/EventLock.h"

namespace Sensor {

ManualProximitySource::ManualProximitySource() = default;

ManualProximitySource::~ManualProximitySource() = default;

bool ManualProximitySource::start(Callback callback) {
    target = std::move(callback);
    return true;
}

void ManualProximitySource::stop() {
    target = nullptr;
}

void ManualProximitySource::feed(bool isNear) {
    const Util::EventLock lock;
    // A copy, because the callback may stop the source.
    const Callback callback = target;
    if (callback) {
        callback(isNear);
    }
}

}  // namespace Sensor
