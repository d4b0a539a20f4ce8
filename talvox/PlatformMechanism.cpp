#include "talvox/PlatformMechanism.h"

#include "core/util/EventLock.h"

namespace Talvox {

namespace {

PlatformMechanism* installedMechanism = nullptr;

}  // namespace

PlatformMechanism::~PlatformMechanism() = default;

void PlatformMechanism::install(PlatformMechanism* mechanism) {
    const Util::EventLock lock;
    installedMechanism = mechanism;
}

PlatformMechanism* PlatformMechanism::getInstalled() {
    return installedMechanism;
}

}  // namespace Talvox
