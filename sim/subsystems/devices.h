#pragma once
#include <cstdint>
#include <optional>

#include "sim/controller_model.h"
#include "sim/faults.h"

// Storage devices: the devices of the controller's file system ("hd0a", a
// plugged "usb1"), each with its kind, its flags and its room.
namespace tav::sim {

enum class DeviceKind { Unknown, Removable, Ramdisk, Remote, Fixed };

struct DeviceOptions {
    DeviceKind kind = DeviceKind::Removable;
    bool enabled = true;
    bool readOnly = false;
    bool shown = true;
    std::uint64_t capacity = 64ull << 20;  // bytes
    // A boot image in BOOTIMAGE, a system package in packages/CellSystem
    // a deployment package in packages/CellDeployment and a boot server in
    // packages/BootServer, as a service engineer's stick holds them.
    bool serviceContent = true;
};

// What writing to a full or a read-only device fails with, as the
// controller's own file jobs report it.
inline constexpr HRESULT kStatusWriteProtected = static_cast<HRESULT>(0x80070013u);
inline constexpr HRESULT kStatusDiskFull = static_cast<HRESULT>(0x80070070u);
inline constexpr HRESULT kStatusPathNotFound = static_cast<HRESULT>(0x80070003u);

// Demo switches. A name holds 1 to 30 characters, no ';', '/' or blank;
// false for another name or one already plugged.
bool PlugDevice(ControllerModel& controller, TextView name, DeviceOptions options = {});
// Pulling out the boot device makes "hd0a" the boot device again.
bool UnplugDevice(ControllerModel& controller, TextView name);
bool SetDeviceReadOnly(ControllerModel& controller, TextView name, bool readOnly);
bool SetDeviceCapacity(ControllerModel& controller, TextView name, std::uint64_t bytes);

// Why `bytes` more cannot be written at `path` (its device missing,
// disabled, read-only or too full); nothing when they can.
std::optional<Failure> WriteRefusal(const ModelState& state, TextView path, std::uint64_t bytes);

// The device a path lies on ("usb1" of "/usb1/a/b"); empty for a bad path.
Text DeviceOf(TextView path);

}  // namespace tav::sim
