// The entry points of the TavSim module: the virtual controller's components
// for a host that finds them through the registry rather than registering
// them in-process.
#include <string>

#include "TavSiblings.h"
#include "sim/class_factory.h"
#include "sim/com_object.h"
#include "tav/platform.h"

namespace {

using RegistryText = std::basic_string<WCHAR>;

struct SimClass {
    const CLSID* clsid;
    const WCHAR* description;
};

const SimClass kClasses[] = {
    {&CLSID_TavComCtrl, OLESTR("TavComCtrl Class (virtual controller)")},
    {&CLSID_TavUser, OLESTR("TavUser Class (virtual controller)")},
};

RegistryText ClassKey(const CLSID& clsid) {
    OLECHAR text[39] = {};
    StringFromGUID2(clsid, text, 39);
    return RegistryText(OLESTR("CLSID\\")) + text;
}

LSTATUS SetString(HKEY key, const WCHAR* name, const RegistryText& value) {
    return RegSetValueExW(key, name, 0, REG_SZ, reinterpret_cast<const BYTE*>(value.c_str()),
                          static_cast<DWORD>((value.size() + 1) * sizeof(WCHAR)));
}

LSTATUS WriteKey(const RegistryText& path, const WCHAR* valueName, const RegistryText& value) {
    HKEY key = nullptr;
    LSTATUS status = RegCreateKeyExW(HKEY_CLASSES_ROOT, path.c_str(), 0, nullptr, REG_OPTION_NON_VOLATILE,
                                     KEY_WRITE, nullptr, &key, nullptr);
    if (status != ERROR_SUCCESS) {
        return status;
    }
    status = SetString(key, valueName, value);
    RegCloseKey(key);
    return status;
}

const char kAddressInThisModule = 0;

// The full path of this module, found from an address inside it.
RegistryText ModulePath() {
    HMODULE module = nullptr;
    if (!GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                            reinterpret_cast<LPCWSTR>(&kAddressInThisModule), &module)) {
        return RegistryText();
    }
    WCHAR path[1024] = {};
    const DWORD length = GetModuleFileNameW(module, path, 1024);
    return length == 0 || length >= 1024 ? RegistryText() : RegistryText(path, length);
}

HRESULT Registered(LSTATUS status) { return status == ERROR_SUCCESS ? S_OK : HRESULT_FROM_WIN32(status); }

}  // namespace

STDAPI DllGetClassObject(REFCLSID clsid, REFIID riid, LPVOID* object) {
    return tav::sim::GetClassObject(clsid, riid, object);
}

STDAPI DllCanUnloadNow() { return tav::sim::LiveObjectsAndLocks() == 0 ? S_OK : S_FALSE; }

STDAPI DllRegisterServer() {
    try {
        const RegistryText path = ModulePath();
        if (path.empty()) {
            return E_UNEXPECTED;
        }
        for (const SimClass& simClass : kClasses) {
            const RegistryText key = ClassKey(*simClass.clsid);
            HRESULT hr = Registered(WriteKey(key, nullptr, simClass.description));
            if (SUCCEEDED(hr)) {
                hr = Registered(WriteKey(key + OLESTR("\\InprocServer32"), nullptr, path));
            }
            if (SUCCEEDED(hr)) {
                hr = Registered(WriteKey(key + OLESTR("\\InprocServer32"), OLESTR("ThreadingModel"), OLESTR("Both")));
            }
            if (FAILED(hr)) {
                return hr;
            }
        }
        return S_OK;
    } catch (...) {
        return E_OUTOFMEMORY;
    }
}

STDAPI DllUnregisterServer() {
    try {
        HRESULT result = S_OK;
        for (const SimClass& simClass : kClasses) {
            const LSTATUS status = RegDeleteTreeW(HKEY_CLASSES_ROOT, ClassKey(*simClass.clsid).c_str());
            if (status != ERROR_SUCCESS && status != ERROR_FILE_NOT_FOUND && SUCCEEDED(result)) {
                result = HRESULT_FROM_WIN32(status);
            }
        }
        return result;
    } catch (...) {
        return E_OUTOFMEMORY;
    }
}
