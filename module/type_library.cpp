#include "module/type_library.h"

#include "tav/bstr.h"
#include "tav/com_ptr.h"

namespace tav {

#ifdef _WIN32

namespace {

using RegisterForUser = HRESULT(WINAPI*)(ITypeLib*, OLECHAR*, OLECHAR*);
using UnregisterForUser = HRESULT(WINAPI*)(REFGUID, WORD, WORD, LCID, SYSKIND);

// The per-user functions are missing from older OLE Automation versions, so
// they are looked up rather than imported.
template <typename Function>
Function FindInOleAutomation(const char* name) {
    const HMODULE oleaut = GetModuleHandleW(L"OLEAUT32.DLL");
    return oleaut != nullptr ? reinterpret_cast<Function>(reinterpret_cast<void*>(GetProcAddress(oleaut, name)))
                             : nullptr;
}

HRESULT LoadFromModule(const OleString& path, ComPtr<ITypeLib>& library) {
    return LoadTypeLibEx(path.c_str(), REGKIND_NONE, &library);
}

}  // namespace

HRESULT RegisterTypeLibrary(const OleString& modulePath, RegistrationScope scope) {
    ComPtr<ITypeLib> library;
    HRESULT hr = LoadFromModule(modulePath, library);
    if (FAILED(hr)) {
        return hr;
    }
    OleString path = modulePath;  // the functions take a non-const path
    if (scope == RegistrationScope::User) {
        if (auto registerForUser = FindInOleAutomation<RegisterForUser>("RegisterTypeLibForUser")) {
            return registerForUser(library.Get(), path.data(), nullptr);
        }
    }
    return RegisterTypeLib(library.Get(), path.data(), nullptr);
}

HRESULT UnregisterTypeLibrary(const OleString& modulePath, RegistrationScope scope) {
    ComPtr<ITypeLib> library;
    HRESULT hr = LoadFromModule(modulePath, library);
    if (FAILED(hr)) {
        return hr;
    }
    TLIBATTR* attributes = nullptr;
    hr = library.Get()->GetLibAttr(&attributes);
    if (FAILED(hr)) {
        return hr;
    }
    const TLIBATTR id = *attributes;
    library.Get()->ReleaseTLibAttr(attributes);
    // Nothing registered is nothing to undo; the removal functions would
    // call it an error.
    Bstr registeredPath;
    if (FAILED(QueryPathOfRegTypeLib(id.guid, id.wMajorVerNum, id.wMinorVerNum, id.lcid, registeredPath.Receive()))) {
        return S_OK;
    }
    if (scope == RegistrationScope::User) {
        if (auto unregisterForUser = FindInOleAutomation<UnregisterForUser>("UnRegisterTypeLibForUser")) {
            return unregisterForUser(id.guid, id.wMajorVerNum, id.wMinorVerNum, id.lcid, id.syskind);
        }
    }
    return UnRegisterTypeLib(id.guid, id.wMajorVerNum, id.wMinorVerNum, id.lcid, id.syskind);
}

#else

HRESULT RegisterTypeLibrary(const OleString&, RegistrationScope) { return S_OK; }
HRESULT UnregisterTypeLibrary(const OleString&, RegistrationScope) { return S_OK; }

#endif

}  // namespace tav
