#include "module/server_exports.h"

#include <new>

#include "core/module_lock.h"
#include "module/class_objects.h"
#include "module/class_table.h"
#include "module/server_registration.h"

namespace {

// No exception may leave an exported function.
template <typename Body>
HRESULT Guarded(Body&& body) noexcept {
    try {
        return body();
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    } catch (...) {
        return E_UNEXPECTED;
    }
}

}  // namespace

STDAPI DllGetClassObject(REFCLSID clsid, REFIID riid, LPVOID* object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    tav::ClassRow* row = tav::FindClass(clsid);
    if (row == nullptr) {
        return CLASS_E_CLASSNOTAVAILABLE;
    }
    return Guarded([&] { return tav::GetClassObject(*row, riid, object); });
}

STDAPI DllCanUnloadNow(void) { return tav::ModuleLock::Count() == 0 ? S_OK : S_FALSE; }

STDAPI DllRegisterServer(void) {
    return Guarded([] { return tav::RegisterServer(tav::RequestedRegistrationScope()); });
}

STDAPI DllUnregisterServer(void) {
    return Guarded([] { return tav::UnregisterServer(tav::RequestedRegistrationScope()); });
}
