#pragma once
#include <cstdint>

#include "sim/controller_model.h"

// The safety controller: its configuration (loaded, put in force by a
// reconfigure, validated, locked), its mode, the safety software of each
// drive module, and the violations it records. Its positional units are the
// drive modules' safety units.
namespace tav::sim {

// Demo switch: the safety controller of drive module `driveModule` (from 1)
// catches a violation of the supervision function `typeWord` ("sts",
// "stz", "sar", "sst", ... as the violation status names them; not "none")
// at its instance `instance` (1 to 8). It is in force until the next
// reconfigure and stays the module's last violation. False for another
// module, word or instance, or with no configuration in force.
bool TriggerSafetyViolation(ControllerModel& controller, int driveModule, TextView typeWord, std::uint32_t instance);

}  // namespace tav::sim
