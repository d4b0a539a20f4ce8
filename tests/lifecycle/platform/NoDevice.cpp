#include "Device.h"

namespace Lifecycle {

std::unique_ptr<Device> Device::make(DeviceHost& /*host*/) {
    return nullptr;
}

}  // namespace Lifecycle
