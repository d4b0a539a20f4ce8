/**
 * @file
 * The device recognizer.
 */
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "Plan.h"

namespace Lifecycle {

/** Hears what the platform recognizer asks of the device; under the event lock. */
class DeviceHost {
  public:
    virtual ~DeviceHost() = default;

    /** An object of the device recognizer is made. @return false when that throws */
    virtual bool onDeviceMade(int64_t handle) = 0;
    /** @param what "start", "stop" or "cancel". @return false when that throws */
    virtual bool onDeviceAsked(int64_t handle, const std::string& what) = 0;
};

/** As long as it lives, the platform recognises speech. One at a time. */
class Device {
  public:
    virtual ~Device() = default;

    /** Null where the library has no platform recognizer. */
    static std::unique_ptr<Device> make(DeviceHost& host);

    /** Tells the recognizer of this handle, if there is one. Under the event lock. */
    virtual void say(int64_t handle, Saying what, int session) = 0;

    /** Makes a callback that throws `std::runtime_error`. Under the event lock. */
    virtual void failInCallback(int64_t handle, const char* text) = 0;

    /** References that are held of the device's objects. */
    virtual long countReferences() const = 0;
};

/** What a `Saying::ERROR` carries. */
constexpr int DEVICE_ERROR = 4;

}  // namespace Lifecycle
