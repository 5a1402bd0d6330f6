// Class objects registered by the process itself with CoRegisterClassObject.
#pragma once
#include "tav/com_types.h"

namespace tav::posix {

// The registered class object for `clsid` in `context`, AddRef'ed; NULL if none.
IUnknown* FindRegisteredClassObject(REFCLSID clsid, DWORD context);

}  // namespace tav::posix
