// Sending messages to slots, and receiving those that arrive for the
// object's own slots.
#include "core/text/format.h"
#include "operations/ipc/message_sink.h"
#include "operations/ipc/slot_replies.h"

namespace tav {
namespace ipc {
namespace {

constexpr short kClientMessage = 4;
constexpr short kSlotClosed = 3;
constexpr HRESULT kInvalidSlot = static_cast<HRESULT>(0xC004AB00);
constexpr HRESULT kNoMessage = static_cast<HRESULT>(0xC0040403);

// The notice that the controller closed a slot: the slot's entry in the
// proxy table (0 when it has none) decides whether it is removed.
void SlotClosed(ControllerObject& object, short slotId) {
    short proxy = 0;
    {
        CriticalSectionLock hold(object.Ipc().Lock());
        const auto found = object.Ipc().Proxies().find(slotId);
        if (found != object.Ipc().Proxies().end()) {
            proxy = found->second;
        }
    }
    if (proxy >= 0) {
        DecodeDisconnect(object, text::Format(OLESTR("-SlotId %d -ProxySlotId %d"), slotId, proxy));
    }
}

}  // namespace

HRESULT Arrive(ControllerObject& object, TavIPCHeaderInternal* header, byte* data, LONG size) {
    ErrorInfo& errors = object.Errors();
    if (header == nullptr || size < 0 || (data == nullptr && size > 0)) {
        return errors.Set(E_INVALIDARG, ErrorSite::Here(), OLESTR("OnMessage: Invalid message."));
    }
    const short slotId = header->ipcParams.did;
    if (header->service == kSlotClosed && header->bodySize == 0 && size == 0) {
        SlotClosed(object, slotId);
        return S_OK;
    }
    const std::shared_ptr<SlotQueue> queue = object.Ipc().Find(slotId);
    if (!queue) {
        return errors.Set(E_INVALIDARG, ErrorSite::Here(), OLESTR("OnMessage: Message for an unknown slot."));
    }
    LONG level = 0;
    switch (queue->ReportBeforeStoring(&level)) {
    case LevelReport::Full:
        ReportLevel(object, slotId, level, true);
        break;
    case LevelReport::Room:
        ReportLevel(object, slotId, level, false);
        break;
    case LevelReport::None:
        break;
    }
    const BSTR body = SysAllocStringByteLen(reinterpret_cast<const char*>(data), static_cast<UINT>(size));
    if (body == nullptr) {
        return errors.Set(E_OUTOFMEMORY, ErrorSite::Here(), OLESTR("OnMessage: Out of memory."));
    }
    const HRESULT hr = queue->Store(header->ipcParams, body);
    if (hr == kMessageRefused) {
        return errors.Set(hr, ErrorSite::Here(), OLESTR("OnMessage: Queue full, message lost."));
    }
    if (FAILED(hr)) {
        return errors.Set(hr, ErrorSite::Here(), OLESTR("OnMessage: Out of memory."));
    }
    return S_OK;
}

}  // namespace ipc

HRESULT ControllerObject::Send(TavInParams* rip, TavIPCParams* params, byte* data, LONG size) {
    // The text names another operation; clients know it so.
    if (params == nullptr || data == nullptr) {
        return errors_.Set(E_POINTER, ErrorSite::Here(), OLESTR("SendSysUserEvent: Invalid arguments."));
    }
    TavIPCHeaderInternal header{};
    header.ipcParams = *params;
    header.bodySize = size;
    header.service = ipc::kClientMessage;
    return Command(rip)
        .ValidParams(OLESTR("TavController::Send. Invalid argument."))
        .Require(size >= 0, E_INVALIDARG, OLESTR("Send. Invalid parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .SendMessage(&header, data, size);
}

HRESULT ControllerObject::Receive(TavInParams* rip, short slotId, TavIPCOutParams* header) {
    const std::shared_ptr<ipc::SlotQueue> queue = ipc_.Find(slotId);
    if (!queue) {
        return errors_.Set(ipc::kInvalidSlot, ErrorSite::Here(), OLESTR("Receive: Invalid slott id."));
    }
    if (header == nullptr) {
        return errors_.Set(E_POINTER, ErrorSite::Here(), OLESTR("Receive: Invalid param."));
    }
    if (rip != nullptr && (rip->callType != Sync || rip->pCallback != nullptr)) {
        return errors_.Set(E_INVALIDARG, ErrorSite::Here(), OLESTR("Receive: Use of callback is not supported."));
    }
    // Told before waiting, so that the controller sends again once the
    // queue drains below its limit.
    const LONG queued = queue->Count();
    if (queued == queue->MaxMsg() - 1) {
        ipc::ReportLevel(*this, slotId, queued, false);
    }
    if (!queue->Take(rip != nullptr ? rip->timeOut : INFINITE, header)) {
        return errors_.Set(ipc::kNoMessage, ErrorSite::Here(), OLESTR("Receive: No message."));
    }
    return S_OK;
}

}  // namespace tav
