#pragma once
#include <string_view>

#include "tav/platform.h"

namespace tav {

// The registry script of every class (TavController.rgs): on Windows the
// module's REGISTRY resource, elsewhere a copy built into the library. Its
// GUIDs are variables (%CLSID_<class>%, %LIBID_TAVCONTROLLERLib%) that the
// registration fills in from the interface definitions.
HRESULT LoadRegistryScript(std::string_view& script);

}  // namespace tav
