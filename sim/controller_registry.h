#pragma once
#include <memory>

#include "sim/controller_model.h"

namespace tav::sim {

// The one controller behind a URL, made on first use and kept for the life of
// the process. Everything after the controller's name ("/sim/DHROOT") reaches
// the same controller as the name alone. NULL for a URL that names no
// controller (no leading slash, or nothing after it).
std::shared_ptr<ControllerModel> ControllerAt(TextView url);

// The part of a URL that names the controller ("/sim" of "/sim/DHROOT").
TextView ControllerUrlOf(TextView url);

}  // namespace tav::sim
