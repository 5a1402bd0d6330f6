#pragma once
#include "core/text/ole_string.h"
#include "tav/platform.h"

namespace tav {

// Process attach: remembers the module's instance handle.
void AttachModule(HINSTANCE instance);
// Process detach: releases the cached class objects.
void DetachModule();

// The module that holds this code: the attached instance, or, where no
// DllMain ran (a host that links the module statically), the executable or
// shared object found from this code's address.
HMODULE ModuleInstance();
HRESULT ModuleFileName(OleString& path);

}  // namespace tav
