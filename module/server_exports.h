#pragma once
#include "tav/platform.h"

// The four functions that the module exports, callable directly where the
// module is linked statically.
STDAPI DllGetClassObject(REFCLSID clsid, REFIID riid, LPVOID* object);
STDAPI DllCanUnloadNow(void);
STDAPI DllRegisterServer(void);
STDAPI DllUnregisterServer(void);
