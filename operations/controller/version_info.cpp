// Version information of the running system or of an installed one.
#include "core/controller_object.h"
#include "core/text/format.h"

namespace tav {
namespace {

// The argument that selects the kind of information; NULL for a kind the
// controller does not know.
const OLECHAR* TypeArgument(TavControllerInfo type) {
    switch (type) {
        case SystemInfo:
            return OLESTR("-Type System");
        case ReleaseInfo:
            return OLESTR("-Type Release");
    }
    return nullptr;
}

}  // namespace

HRESULT ControllerObject::GetVersionInfo(TavInParams* rip, TavControllerInfo type, BSTR* info) {
    const OLECHAR* typeArgument = TypeArgument(type);
    return Command(rip)
        .ValidParams(OLESTR("TavController::GetVersionInfo: Invalid TavInParams."))
        .OutPointer(info, OLESTR("TavController::GetVersionInfo: Invalid out-pointer"))
        .Initialised(OLESTR("TavController::GetVersionInfo. TavController used before Initialized"))
        .Require(typeArgument != nullptr, E_INVALIDARG,
                 OLESTR("TavController::GetVersionInfo - Unknown information type"))
        .Get(OLESTR("VersionInfo"), ViewOf(typeArgument))
        // Version information is free text: the caller takes over the reply's own string.
        .TakeText(info, OLESTR("TavController::GetVersionInfo - Controller returned invalid result"));
}

HRESULT ControllerObject::GetVersionInfoFromSystem(TavInParams* rip, BSTR systemName, TavControllerInfo type,
                                                   BSTR* info) {
    const OLECHAR* typeArgument = TypeArgument(type);
    return Command(rip)
        .ValidParams(OLESTR("GetVersionInfoFromSystem: Invalid TavInParams"))
        .OutPointer(info, OLESTR("GetVersionInfoFromSystem: Invalid out-pointer"))
        .Initialised(OLESTR("GetVersionInfoFromSystem. TavController used before Initialized"))
        .Require(systemName != nullptr, E_INVALIDARG, OLESTR("GetVersionInfoFromSystem: Invalid argument"))
        .Require(typeArgument != nullptr, E_INVALIDARG,
                 OLESTR("GetVersionInfoFromSystem - Unknown information type"))
        .Get(OLESTR("SystemInfo"),
             text::Format(OLESTR("%s -SystemName \"%s\""), ViewOf(typeArgument), ViewOf(systemName)))
        .TakeText(info, OLESTR("GetVersionInfoFromSystem - Controller returned invalid result"));
}

HRESULT ControllerObject::UnpackVersionInfo(VARIANT* data, BSTR* info) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackVersionInfo. NULL VARIANT"))
        .OutPointer(info, OLESTR(""))
        .Clear(info)
        .IsBstr(OLESTR("UnpackVersionInfo. Non-BSTR VARIANT"))
        .WholeText(info, OLESTR(""));
}

}  // namespace tav
