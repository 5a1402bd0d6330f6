#include "module/registry_script.h"

#include <cstddef>

#ifdef _WIN32
#include "module/module_state.h"
#include "module/resource.h"
#endif

namespace tav {

#ifndef _WIN32
// Generated from TavController.rgs by embed_script.cmake.
extern const char kRegistryScript[];
extern const size_t kRegistryScriptSize;
#endif

#ifdef _WIN32

HRESULT LoadRegistryScript(std::string_view& script) {
    const HMODULE module = ModuleInstance();
    HRSRC found = FindResourceW(module, MAKEINTRESOURCEW(IDR_TAVCONTROLLER), L"REGISTRY");
    HGLOBAL loaded = found != nullptr ? LoadResource(module, found) : nullptr;
    const void* text = loaded != nullptr ? LockResource(loaded) : nullptr;
    if (text == nullptr) {
        const DWORD error = GetLastError();
        return error == ERROR_SUCCESS ? HRESULT_FROM_WIN32(ERROR_RESOURCE_DATA_NOT_FOUND) : HRESULT_FROM_WIN32(error);
    }
    script = std::string_view(static_cast<const char*>(text), SizeofResource(module, found));
    return S_OK;
}

#else

HRESULT LoadRegistryScript(std::string_view& script) {
    script = std::string_view(kRegistryScript, kRegistryScriptSize);
    return S_OK;
}

#endif

}  // namespace tav
