#pragma once
#include "sim/controller_model.h"

// Vision cameras on the controller's camera network. The controller lists
// the cameras it has found, by index in the order it found them; a camera
// plugged in later is found by the next "LMRefreshCameras".
namespace tav::sim {

// Demo switches. A camera is known by its MAC address ("00:1A:2B:3C:4D:60",
// six pairs of hexadecimal digits). A new camera comes with its factory
// settings: DHCP, the user "admin" and a name of its own ("Lumeret-4D60")
// until a client names it. False for a bad MAC address or a camera already
// plugged in.
bool PlugCamera(ControllerModel& controller, TextView mac);
// The camera drops off the network at once: a listed one reads Disconnected.
// False when no camera with that MAC address is plugged in.
bool UnplugCamera(ControllerModel& controller, TextView mac);

}  // namespace tav::sim
