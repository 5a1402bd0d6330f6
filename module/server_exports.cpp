#include "module/server_exports.h"

#include <new>

#include "core/module_lock.h"
#include "module/class_objects.h"
#include "module/class_table.h"
#include "module/server_registration.h"
#include "tav/guarded.h"


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

STDAPI DllRegisterServer(void) {
    return tav::Guarded([] { return tav::RegisterServer(tav::RequestedRegistrationScope()); });
}

STDAPI DllUnregisterServer(void) {
    return tav::Guarded([] { return tav::UnregisterServer(tav::RequestedRegistrationScope()); });
}
