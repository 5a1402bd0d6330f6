// How a client that knows only ProgIDs gets at the module's objects.
#pragma once
#include <string>

#include "tav/com_ptr.h"
#include "tav/platform.h"

namespace tav::conformance {

// CLSIDFromProgID, then CoCreateInstance in-process for IUnknown.
HRESULT CreateByProgId(const std::wstring& progId, ComPtr<IUnknown>& object, IUnknown* outer = nullptr);

// Whether the module under test is mapped into this process.
bool ControllerModuleLoaded();

}  // namespace tav::conformance
