// The names of the controller's software version and of installed products.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {

HRESULT ControllerObject::GetVersionName(TavInParams* rip, BSTR* name) {
    return Command(rip)
        .ValidParams(OLESTR("GetVersionName: Invalid TavInParams"))
        .OutPointer(name, OLESTR("GetVersionName: Invalid out-pointer"))
        .Initialised(OLESTR("GetVersionName. TavController used before Initialized"))
        .Get(OLESTR("VersionName"))
        .Decode([&](VARIANT* reply) { return UnpackVersionName(reply, name); });
}

HRESULT ControllerObject::UnpackVersionName(VARIANT* data, BSTR* name) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackVersionName. NULL data pointer"))
        .OutPointer(name, OLESTR("UnpackVersionName. Invalid out pointer"))
        .Clear(name)
        .IsBstr(OLESTR("UnpackVersionName. Data-variant not of type VT_BSTR"))
        .AfterPrefix(OLESTR("-Name "), name, OLESTR("UnpackVersionName. Bad format."));
}

HRESULT ControllerObject::GetProductVersionName(TavInParams* rip, BSTR product, BSTR* name) {
    return Command(rip)
        .ValidParams(OLESTR("GetProductVersionName: Invalid TavInParams"))
        .OutPointer(name, OLESTR("GetProductVersionName: Invalid out-pointer"))
        .Initialised(OLESTR("GetProductVersionName. TavController used before Initialized"))
        .Require(!ViewOf(product).empty(), E_INVALIDARG, OLESTR("GetProductVersionName: Invalid product name"))
        .Get(OLESTR("ProductVersionName"), text::Format(OLESTR("-Name \"%s\""), ViewOf(product)))
        .Decode([&](VARIANT* reply) { return UnpackProductVersionName(reply, name); });
}

HRESULT ControllerObject::UnpackProductVersionName(VARIANT* data, BSTR* name) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackProductVersionName. NULL data pointer"))
        .OutPointer(name, OLESTR("UnpackProductVersionName. Invalid out pointer"))
        .Clear(name)
        .IsBstr(OLESTR("UnpackProductVersionName. Data-variant not of type VT_BSTR"))
        .AfterPrefix(OLESTR("-Name "), name, OLESTR("UnpackProductVersionName. Bad format."));
}

}  // namespace tav
