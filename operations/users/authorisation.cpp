// The user authorisation system's lists. Its configuration is not offered
// through this object.
#include "core/controller_object.h"

namespace tav {

HRESULT ControllerObject::GetUASConfiguration(TavInParams*, TavUASConfigPart, LONG*, byte**) { return E_NOTIMPL; }

HRESULT ControllerObject::SetUASConfiguration(TavInParams*, TavUASConfigPart, LONG, byte*) { return E_NOTIMPL; }

// The lists are free text: the caller takes over the reply's own string.
HRESULT ControllerObject::GetUserList(TavInParams* rip, BSTR* users) {
    return Command(rip)
        .ValidParams(OLESTR("GetUserList: Invalid TavInParams"))
        .OutPointer(users, OLESTR("GetUserList: Invalid out-pointer"))
        .Initialised(OLESTR("Helper used before initialized."))
        .Get(OLESTR("UASUsers"))
        .TakeText(users, OLESTR("Get: Bad VARIANT received"));
}

HRESULT ControllerObject::GetGrantList(TavInParams* rip, BSTR* grants) {
    return Command(rip)
        .ValidParams(OLESTR("GetGrantList: Invalid TavInParams"))
        .OutPointer(grants, OLESTR("GetGrantList: Invalid out-pointer"))
        .Initialised(OLESTR("Helper used before initialized."))
        .Get(OLESTR("UASGrants"))
        .TakeText(grants, OLESTR("Get: Bad VARIANT received"));
}

}  // namespace tav
