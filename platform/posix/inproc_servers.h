// In-process servers loaded from their InprocServer32 path.
#pragma once
#include <string>

#include "tav/com_types.h"

namespace tav::posix {

// Loads the module at `path` (once; later calls reuse it) and asks its
// DllGetClassObject. CO_E_DLLNOTFOUND when it cannot be loaded,
// CO_E_ERRORINDLL when it exports no DllGetClassObject.
HRESULT GetClassObjectFromServer(const std::string& path, REFCLSID clsid, REFIID iid, void** object);

}  // namespace tav::posix
