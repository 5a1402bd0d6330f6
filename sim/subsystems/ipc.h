#pragma once
#include "TavController.h"
#include "sim/caller.h"
#include "sim/controller_model.h"

// Inter-process messaging: named slots owned by clients, messages routed to
// the owner's message sink, flow control by the owners' queue reports, and
// an echo slot that sends every message back to the slot it came from.
namespace tav::sim::ipc {

// The echo slot, always there.
inline constexpr short kEchoSlot = 1;
inline constexpr const OLECHAR* kEchoSlotName = OLESTR("Echo");

// Routes one message from `caller` to the slot it names. S_OK once the
// message is delivered or held for a full queue; otherwise a failure status
// with its text in `error`.
HRESULT RouteMessage(ControllerModel& controller, const Caller& caller, const TavIPCHeaderInternal& header,
                     const byte* data, LONG size, Text& error);

// The controller closes a slot on its own: the owner is told with a closing
// notice. False for an unknown slot.
bool CloseSlot(ControllerModel& controller, short slotId);

// A client went away: its slots and its proxy are dropped without notice.
void ClientGone(ControllerModel& controller, std::uint32_t clientId);

}  // namespace tav::sim::ipc
