// Environment variables of the controller system.
#include "core/controller_object.h"

namespace tav {

HRESULT ControllerObject::GetEnvironmentVariable(TavInParams* rip, BSTR name, BSTR* value) {
    // The variables live in the controller's root service, not in the
    // controller object the URL names.
    OleString rootUrl(ViewOf(Url()));
    rootUrl += OLESTR("/DHROOT");
    const Bstr url(rootUrl);
    return Command(rip)
        .ValidParams(OLESTR("GetEnvironmentVariable: Invalid TavInParams"))
        .OutPointer(value, OLESTR("GetEnvironmentVariable: Invalid out-pointer"))
        .Initialised(OLESTR("GetEnvironmentVariable. TavController used before Initialized"))
        .Require(!ViewOf(name).empty(), E_INVALIDARG, OLESTR("GetEnvironmentVariable: Empty environment variable"))
        .Require(!url.IsNull(), E_OUTOFMEMORY, OLESTR("SysAllocString failed"))
        .SendTo(url.Get(), Verb::Get, OLESTR("EnvironmentVar"), ViewOf(name))
        .Decode([&](VARIANT* reply) { return UnpackEnvironmentVariable(reply, value); });
}

HRESULT ControllerObject::UnpackEnvironmentVariable(VARIANT* data, BSTR* value) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackEnvironmentVariable. NULL data-variant"))
        .OutPointer(value, OLESTR(""))
        .Clear(value)
        .IsBstr(OLESTR("UnpackEnvironmentVariable. Invalid argument."))
        .WholeText(value);
}

}  // namespace tav
