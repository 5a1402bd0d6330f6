#include "tavctl/module_loader.h"

#include "tavctl/text.h"

#ifndef _WIN32
#include <dlfcn.h>
#endif

namespace tavctl {
namespace {

#ifdef _WIN32
constexpr const char* kModuleFile = "TavController.dll";
#else
constexpr const char* kModuleFile = "TavController.so";
#endif

std::filesystem::path ExecutablePath() {
#ifdef _WIN32
    WCHAR buffer[4096] = {};
    const DWORD length = GetModuleFileNameW(nullptr, buffer, 4096);
    return length == 0 || length >= 4096 ? std::filesystem::path() : std::filesystem::path(buffer);
#else
    std::error_code error;
    return std::filesystem::read_symlink("/proc/self/exe", error);
#endif
}

struct NamedClass {
    const char* name;
    const CLSID* clsid;
};

const NamedClass kClasses[] = {
    {"TavController", &CLSID_TavController},     {"TavController2", &CLSID_TavController2},
    {"TavController3", &CLSID_TavController3},   {"TavController4", &CLSID_TavController4},
    {"TavController5", &CLSID_TavController5},   {"TavController6", &CLSID_TavController6},
    {"TavController7", &CLSID_TavController7},   {"TavController8", &CLSID_TavController8},
    {"TavController9", &CLSID_TavController9},   {"TavController10", &CLSID_TavController10},
    {"TavController11", &CLSID_TavController11}, {"TavController12", &CLSID_TavController12},
    {"TavController13", &CLSID_TavController13}, {"TavController14", &CLSID_TavController14},
    {"TavController15", &CLSID_TavController15}, {"TavController16", &CLSID_TavController16},
    {"TavController17", &CLSID_TavController17},
};

}  // namespace

std::optional<ControllerModule> ControllerModule::Load(const std::filesystem::path& path, std::string& error) {
#ifdef _WIN32
    HMODULE handle = LoadLibraryW(path.wstring().c_str());
    if (handle == nullptr) {
        error = "cannot load " + path.string() + " (error " + std::to_string(GetLastError()) + ")";
        return std::nullopt;
    }
    auto entry = reinterpret_cast<LPFNGETCLASSOBJECT>(
        reinterpret_cast<void*>(GetProcAddress(handle, "DllGetClassObject")));
#else
    void* handle = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (handle == nullptr) {
        const char* reason = dlerror();
        error = "cannot load " + path.string() + ": " + (reason == nullptr ? "unknown reason" : reason);
        return std::nullopt;
    }
    auto entry = reinterpret_cast<LPFNGETCLASSOBJECT>(dlsym(handle, "DllGetClassObject"));
#endif
    // The module stays loaded for the life of the process: objects and
    // threads of it may outlive any point at which unloading would be safe.
    if (entry == nullptr) {
        error = path.string() + " does not export DllGetClassObject";
        return std::nullopt;
    }
    return ControllerModule(path, entry);
}

HRESULT ControllerModule::CreateInstance(REFCLSID clsid, REFIID riid, void** object) const {
    *object = nullptr;
    IClassFactory* factory = nullptr;
    HRESULT hr = getClassObject_(clsid, IID_IClassFactory, reinterpret_cast<void**>(&factory));
    if (FAILED(hr)) {
        return hr;
    }
    hr = factory->CreateInstance(nullptr, riid, object);
    factory->Release();
    return hr;
}

std::vector<std::filesystem::path> DefaultModulePaths() {
    const std::filesystem::path folder = ExecutablePath().parent_path();
    return {folder / kModuleFile, folder.parent_path() / "module" / kModuleFile};
}

const CLSID* ClassByName(const std::string& name) {
    const std::string wanted = Lower(name);
    for (const NamedClass& entry : kClasses) {
        if (Lower(entry.name) == wanted) {
            return entry.clsid;
        }
    }
    return nullptr;
}

}  // namespace tavctl
