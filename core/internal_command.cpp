// Commands that the object sends of its own accord rather than for a client.
#include "core/controller_object.h"

namespace tav {

HRESULT ControllerObject::InternalCommand(OleStringView command, OleStringView args, ULONG* result) {
    ITavCommand2* component = Command2();
    if (component == nullptr) {
        return E_NOINTERFACE;
    }
    const Bstr commandText(command);
    const Bstr argsText(args);
    if (commandText.IsNull() || argsText.IsNull()) {
        return E_OUTOFMEMORY;
    }
    TavInParams internal{};
    internal.callType = Sync;
    TavInParams second = internal;
    CommandReply reply;
    ULONG unused = 0;
    return component->ExecuteEx(&internal, &reply.Record(), &second, ClientValue(), Url(), commandText.Get(),
                                argsText.Get(), result != nullptr ? result : &unused);
}

}  // namespace tav
