#pragma once
// The replies about slots that the object decodes itself: a connected slot,
// a disconnected one, and the level reports it sends about its queues.
#include "core/controller_object.h"

namespace tav::ipc {

// The proxy slot id under which the controller knows this object's slots:
// announced with "CtrlCmd" before the first slot is connected, and expected
// back in every connect reply.
short ProxyId(const ControllerObject& object);

// Hands the object's message sink to the command component and announces
// its proxy id, once; a failure is the component's.
HRESULT ConnectSink(ControllerObject& object);

// "-SlotId %d -ProxySlotId %d -name %38s -MaxMsg %d -MaxSize %d": a local
// queue made and entered in the slot and proxy tables, its id in *slotId.
HRESULT DecodeConnect(ControllerObject& object, VARIANT* reply, short expectedProxy, short* slotId);

// "-SlotId %d -ProxySlotId %d": the slot removed with everything queued,
// unless the proxy slot id is -2.
HRESULT DecodeDisconnect(ControllerObject& object, OleStringView reply);

// Tells the controller a queue's level, with the full mark or without.
void ReportLevel(ControllerObject& object, short slotId, LONG level, bool full);

}  // namespace tav::ipc
