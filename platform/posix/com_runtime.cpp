// Class lookup for in-process servers. There are no apartments: CoInitialize
// only counts, so that its S_OK/S_FALSE answers match Windows.
#include <new>
#include <string>

#include "class_objects.h"
#include "inproc_servers.h"
#include "registry_lookup.h"
#include "tav/com_api.h"
#include "utf.h"

namespace {

thread_local unsigned long initialisations = 0;

HRESULT GetRegisteredServerClassObject(REFCLSID clsid, REFIID iid, void** object) {
    OLECHAR clsidText[39];
    StringFromGUID2(clsid, clsidText, 39);
    std::u16string path;
    auto entry = tav::posix::ReadClassesDefaultValue(u"CLSID\\" + std::u16string(clsidText) + u"\\InprocServer32", path);
    if (entry != tav::posix::ClassesEntry::Found) return REGDB_E_CLASSNOTREG;
    return tav::posix::GetClassObjectFromServer(tav::posix::ToUtf8(path), clsid, iid, object);
}

}  // namespace

extern "C" {

HRESULT CoInitialize(LPVOID pvReserved) { return CoInitializeEx(pvReserved, COINIT_APARTMENTTHREADED); }

HRESULT CoInitializeEx(LPVOID, DWORD) { return initialisations++ == 0 ? S_OK : S_FALSE; }

void CoUninitialize(void) {
    if (initialisations > 0) --initialisations;
}

HRESULT CoGetClassObject(REFCLSID rclsid, DWORD dwClsContext, LPVOID, REFIID riid, LPVOID* ppv) {
    if (ppv == nullptr) return E_INVALIDARG;
    *ppv = nullptr;
    if (IUnknown* registered = tav::posix::FindRegisteredClassObject(rclsid, dwClsContext)) {
        HRESULT hr = registered->QueryInterface(riid, ppv);
        registered->Release();
        return hr;
    }
    if ((dwClsContext & CLSCTX_INPROC_SERVER) == 0) return REGDB_E_CLASSNOTREG;
    try {
        return GetRegisteredServerClassObject(rclsid, riid, ppv);
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
}

HRESULT CoCreateInstance(REFCLSID rclsid, LPUNKNOWN pUnkOuter, DWORD dwClsContext, REFIID riid, LPVOID* ppv) {
    if (ppv == nullptr) return E_POINTER;
    *ppv = nullptr;
    IClassFactory* factory = nullptr;
    HRESULT hr = CoGetClassObject(rclsid, dwClsContext, nullptr, IID_IClassFactory, reinterpret_cast<void**>(&factory));
    if (FAILED(hr)) return hr;
    hr = factory->CreateInstance(pUnkOuter, riid, ppv);
    factory->Release();
    return hr;
}

}  // extern "C"
