#pragma once
#include "core/text/ole_string.h"
#include "module/registrar.h"
#include "tav/platform.h"

namespace tav {

// Registers the type library TAVCONTROLLERLib held as resource TYPELIB 1 in
// the module file, and takes it back with the library's own identifier,
// version and locale. Only the Windows module carries a type library;
// elsewhere there is none and both calls succeed without doing anything.
HRESULT RegisterTypeLibrary(const OleString& modulePath, RegistrationScope scope);
HRESULT UnregisterTypeLibrary(const OleString& modulePath, RegistrationScope scope);

}  // namespace tav
