#pragma once
#include <cstdint>

#include "tav/platform.h"

namespace tav::sim {

// Who sent a command: the connected client (one per command component, as
// the controller's client list shows it) and the value its controller object
// named itself by, where the command carried one (ExecuteEx). Mastership
// ("this is me"), impersonation and message routing go by these.
struct Caller {
    std::uint32_t clientId = 0;
    ULONG clientValue = 0;
};

}  // namespace tav::sim
