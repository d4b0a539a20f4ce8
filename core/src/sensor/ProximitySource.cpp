#include "core/sensor/ProximitySource.h"

#include <utility>

#include "core/util/EventLock.h"

namespace Sensor {

namespace {

// Guarded by the event lock. Never destroyed: sources may be made until the process has gone.
ProximitySource::Factory& installedFactory() {
    static auto* const factory = new ProximitySource::Factory;
    return *factory;
}

}  // namespace

ProximitySource::~ProximitySource() = default;

boost::shared_ptr<ProximitySource> ProximitySource::createSource() {
    const Util::EventLock lock;
    // A copy, because the factory may install another one.
    const Factory factory = installedFactory();
    return factory ? factory() : boost::shared_ptr<ProximitySource>();
}

void ProximitySource::setFactory(Factory factory) {
    const Util::EventLock lock;
    installedFactory() = std::move(factory);
}

}  // namespace Sensor
