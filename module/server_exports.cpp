#include "module/server_exports.h"

#include <new>

#include "core/module_lock.h"
#include "module/class_objects.h"
#include "module/class_table.h"
#include "module/server_registration.h"
#include "tav/guarded.h"
#include "tav/registry_file.h"


STDAPI DllGetClassObject(REFCLSID clsid, REFIID riid, LPVOID* object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    *object = nullptr;
    tav::ClassRow* row = tav::FindClass(clsid);
    if (row == nullptr) {
        return CLASS_E_CLASSNOTAVAILABLE;
    }
    return tav::Guarded([&] { return tav::GetClassObject(*row, riid, object); });
}

STDAPI DllCanUnloadNow(void) { return tav::ModuleLock::Count() == 0 ? S_OK : S_FALSE; }

namespace {

// The registration's many writes are saved together: a registry kept in a
// file is then rewritten once, not once per value.
template <typename Registration> HRESULT InOneBatch(Registration&& registration) {
    return tav::Guarded([&] {
        tav::RegistryBatch batch;
        const HRESULT hr = registration(tav::RequestedRegistrationScope());
        const LONG saved = batch.End();
        return SUCCEEDED(hr) && saved != ERROR_SUCCESS ? HRESULT_FROM_WIN32(saved) : hr;
    });
}

}  // namespace

STDAPI DllRegisterServer(void) { return InOneBatch(tav::RegisterServer); }

STDAPI DllUnregisterServer(void) { return InOneBatch(tav::UnregisterServer); }
