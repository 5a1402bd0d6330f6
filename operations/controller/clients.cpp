// The API clients connected to the controller, as the controller's XML document.
#include "core/controller_object.h"

namespace tav {

HRESULT ControllerObject::GetConnectedTavAPIClients(TavInParams* rip, BSTR* xml) {
    return Command(rip)
        .ValidParams(OLESTR("GetConnectedTavAPIClients: Invalid TavInParams"))
        .OutPointer(xml, OLESTR("GetConnectedTavAPIClients: Invalid out-pointer"))
        .Initialised(OLESTR("GetConnectedTavAPIClients. TavController used before Initialized"))
        .Get(OLESTR("ConnectedClients"))
        .Decode([&](VARIANT* reply) { return UnpackConnectedTavAPIClients(reply, xml); });
}

HRESULT ControllerObject::UnpackConnectedTavAPIClients(VARIANT* data, BSTR* xml) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackConnectedTavAPIClients. NULL VARIANT"))
        .OutPointer(xml, OLESTR(""))
        .Clear(xml)
        .IsBstr(OLESTR("UnpackConnectedTavAPIClients. Non-BSTR VARIANT"))
        .WholeText(xml);
}

}  // namespace tav
