#pragma once
#include "module/registrar.h"
#include "tav/platform.h"

namespace tav {

// The environment variable that makes DllRegisterServer and
// DllUnregisterServer work per user: "1" selects HKCU\Software\Classes and
// per-user type library registration, anything else (or nothing) the machine.
inline constexpr char kPerUserVariable[] = "TAVCONTROLLER_REGISTER_PER_USER";
RegistrationScope RequestedRegistrationScope();

// Run the registry script once for every class row, then the type library;
// the first failure ends the run and is returned.
HRESULT RegisterServer(RegistrationScope scope);
HRESULT UnregisterServer(RegistrationScope scope);

}  // namespace tav
