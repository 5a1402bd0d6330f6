// Connecting and disconnecting message slots.
#include "core/text/format.h"
#include "operations/controller/latin1.h"
#include "operations/ipc/message_sink.h"
#include "operations/ipc/slot_replies.h"

namespace tav {
namespace ipc {
namespace {

constexpr HRESULT kQueueTooLarge = static_cast<HRESULT>(0xC0048430);
constexpr short kLargestQueue = 200;
constexpr short kNothingToDo = -2;

}  // namespace

short ProxyId(const ControllerObject& object) { return static_cast<short>(object.ClientValue() % 32767 + 1); }

HRESULT ConnectSink(ControllerObject& object) {
    IpcState& state = object.Ipc();
    if (state.sinkConnected) {
        return S_OK;
    }
    MessageSink* sink = state.Sink(object);
    if (sink == nullptr) {
        return E_OUTOFMEMORY;
    }
    HRESULT hr = object.CommandComponent()->ConnectIPCSink(static_cast<_ITavIPCMessages*>(sink));
    if (SUCCEEDED(hr)) {
        hr = object.InternalCommand(OLESTR("CtrlCmd"), text::Format(OLESTR("-ProxyId %d"), ProxyId(object)));
    }
    state.sinkConnected = SUCCEEDED(hr);
    return hr;
}

HRESULT DecodeConnect(ControllerObject& object, VARIANT* reply, short expectedProxy, short* slotId) {
    ErrorInfo& errors = object.Errors();
    if (slotId == nullptr) {
        return errors.Set(E_POINTER, ErrorSite::Here(), OLESTR("UnpackConnect. Invalid out-parameter."));
    }
    if (reply == nullptr || reply->vt != VT_BSTR) {
        return errors.Set(E_FAIL, ErrorSite::Here(), OLESTR("UnpackConnect. Invalid argument."));
    }
    LONG id = 0;
    LONG proxy = 0;
    OLECHAR name[39];
    LONG maxMsg = 0;
    LONG maxSize = 0;
    if (text::Scan<OLESTR("-SlotId %d -ProxySlotId %d -name %38s -MaxMsg %d -MaxSize %d")>(
            ViewOf(reply->bstrVal), &id, &proxy, name, &maxMsg, &maxSize) < 5) {
        return errors.Set(E_FAIL, ErrorSite::Here(), OLESTR("UnpackConnect. Invalid argument."));
    }
    if (proxy != expectedProxy) {
        return errors.Set(E_UNEXPECTED, ErrorSite::Here(), OLESTR("UnpackConnect. Invalid proxy id."));
    }
    const auto slot = static_cast<short>(id);
    std::shared_ptr<SlotQueue> queue =
        SlotQueue::Create(slot, static_cast<short>(maxMsg), static_cast<short>(maxSize));
    if (!queue) {
        return errors.Set(E_OUTOFMEMORY, ErrorSite::Here(), OLESTR("UnpackConnect. Outof memory."));
    }
    IpcState& state = object.Ipc();
    {
        CriticalSectionLock hold(state.Lock());
        if (!state.Slots().emplace(slot, queue).second) {
            return errors.Set(E_UNEXPECTED, ErrorSite::Here(), OLESTR("UnpackConnect. Error insert new slot in list."));
        }
        if (!state.Proxies().emplace(slot, static_cast<short>(proxy)).second) {
            state.Slots().erase(slot);
            return errors.Set(E_UNEXPECTED, ErrorSite::Here(), OLESTR("UnpackConnect. Error add slot to map."));
        }
    }
    *slotId = slot;
    return S_OK;
}

HRESULT DecodeDisconnect(ControllerObject& object, OleStringView reply) {
    ErrorInfo& errors = object.Errors();
    LONG id = 0;
    LONG proxy = 0;
    if (text::Scan<OLESTR("-SlotId %d -ProxySlotId %d")>(reply, &id, &proxy) < 2) {
        return errors.Set(E_FAIL, ErrorSite::Here(), OLESTR("UnpackConnect. Invalid argument."));
    }
    if (proxy == kNothingToDo) {
        return S_OK;
    }
    const auto slot = static_cast<short>(id);
    std::shared_ptr<SlotQueue> queue;
    IpcState& state = object.Ipc();
    {
        CriticalSectionLock hold(state.Lock());
        const auto found = state.Slots().find(slot);
        if (found == state.Slots().end()) {
            return errors.Set(E_UNEXPECTED, ErrorSite::Here(), OLESTR("UnpackConnect. Could not find the slotid."));
        }
        if (!found->second) {
            return errors.Set(E_UNEXPECTED, ErrorSite::Here(),
                              OLESTR("UnpackConnect. Could not find the ipc queue."));
        }
        queue = std::move(found->second);
        state.Proxies().erase(slot);
        state.Slots().erase(found);
    }
    // A Receive still waiting on the queue wakes and finds it empty.
    queue->Close();
    return S_OK;
}

void ReportLevel(ControllerObject& object, short slotId, LONG level, bool full) {
    // The reports are best effort: a lost one is repeated by the next change.
    object.InternalCommand(OLESTR("QueueStatus"), full ? text::Format(OLESTR("-SlotId %d -Level %d -QFull"), slotId, level)
                                                       : text::Format(OLESTR("-SlotId %d -Level %d"), slotId, level));
}

}  // namespace ipc

HRESULT ControllerObject::Connect(TavInParams* rip, BSTR name, short maxmsg, short maxsize, short* slotId) {
    const OleStringView text = ViewOf(name);
    return Command(rip)
        .ValidParams(OLESTR("TavController::Connect. Invalid argument."))
        .OutPointer(slotId, OLESTR("Connect. Invalid out-parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(maxmsg < ipc::kLargestQueue, ipc::kQueueTooLarge, OLESTR("TavController cannot create queues that large"))
        .Require(!text.empty(), E_INVALIDARG, OLESTR("TavController::Connect. Invalid argument."))
        .Require(IsLatin1(text), kTextNotLatin1, OLESTR(""))
        .InvokeComponent(CommandComponent(), [&] { return ipc::ConnectSink(*this); })
        .Set(OLESTR("Connect"),
             text::Format(OLESTR("-Name %.38s -MaxMsg %d -MaxSize %d -SlotId -1"), text, maxmsg, maxsize))
        .Decode([&](VARIANT* reply) { return ipc::DecodeConnect(*this, reply, ipc::ProxyId(*this), slotId); });
}

HRESULT ControllerObject::Disconnect(TavInParams* rip, short slotId) {
    return Command(rip)
        .ValidParams(OLESTR("TavController::Disconnect. Invalid argument."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Set(OLESTR("Disconnect"), text::Format(OLESTR("-slotid %d"), slotId))
        .Decode([&](VARIANT* reply) {
            return ipc::DecodeDisconnect(*this, reply->vt == VT_BSTR ? ViewOf(reply->bstrVal) : OleStringView());
        });
}

}  // namespace tav
