#pragma once
// The safety controller's words for its modes, read in its status replies and
// written in the command that changes the mode.
#include "core/controller_object.h"

namespace tav {

inline constexpr WordValue<TavVantorSafetyMode> kSafetyModeWords[] = {
    {OLESTR("active"), VantorSafetyModeActiveMode},
    {OLESTR("commissioning"), VantorSafetyModeCommissioningMode},
    {OLESTR("service"), VantorSafetyModeServiceMode}};

}  // namespace tav
