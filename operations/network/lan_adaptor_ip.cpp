// The LAN adaptor's method and addresses in one command.
#include "core/controller_object.h"
#include "operations/network/lan_fields.h"

namespace tav {

using network::AddressField;

HRESULT ControllerObject::GetLANAdaptorIP(TavInParams* rip, IPMethod* method, BSTR* address, BSTR* mask,
                                          BSTR* gateway) {
    return Command(rip)
        .ValidParams(OLESTR("GetLANAdaptorIP: Invalid TavInParams"))
        .OutPointers(OLESTR("GetLANAdaptorIP: Invalid out-pointer"), method, address, mask, gateway)
        .Initialised(OLESTR("GetLANAdaptorIP. TavController used before Initialized"))
        .Get(OLESTR("LANAdaptor"))
        .Decode([&](VARIANT* reply) { return UnpackLANAdaptorIP(reply, method, address, mask, gateway); });
}

HRESULT ControllerObject::UnpackLANAdaptorIP(VARIANT* data, IPMethod* method, BSTR* address, BSTR* mask,
                                             BSTR* gateway) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackLANAdaptorIP. NULL data pointer"))
        .OutPointers(OLESTR("UnpackLANAdaptorIP. Invalid out pointer"), method, address, mask, gateway)
        .IsBstr(OLESTR("UnpackLANAdaptorIP. Data-variant not of type VT_BSTR"))
        .Fields<OLESTR("-Method %9s -Address %s -Submask %s -Gateway %s")>(
            OLESTR("UnpackLANAdaptorIP failed."), network::MethodField(method), AddressField{address},
            AddressField{mask}, AddressField{gateway});
}

}  // namespace tav
