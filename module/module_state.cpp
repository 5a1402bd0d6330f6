#include "module/module_state.h"

#include <atomic>

#include "module/class_objects.h"

namespace tav {
namespace {

std::atomic<HMODULE> attachedInstance{nullptr};

// Any address inside this module will do to find it.
const char moduleAnchor = 0;

}  // namespace

void AttachModule(HINSTANCE instance) { attachedInstance.store(static_cast<HMODULE>(instance)); }

void DetachModule() { ReleaseClassObjects(); }

HMODULE ModuleInstance() {
    HMODULE instance = attachedInstance.load();
    if (instance == nullptr) {
        GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                           reinterpret_cast<LPCWSTR>(&moduleAnchor), &instance);
    }
    return instance;
}

HRESULT ModuleFileName(OleString& path) {
    const HMODULE instance = ModuleInstance();
    OleString buffer(MAX_PATH, OLECHAR(0));
    for (;;) {
        const DWORD size = static_cast<DWORD>(buffer.size());
        const DWORD length = GetModuleFileNameW(instance, buffer.data(), size);
        if (length == 0) {
            const DWORD error = GetLastError();
            return error == ERROR_SUCCESS ? E_FAIL : HRESULT_FROM_WIN32(error);
        }
        if (length < size) {
            buffer.resize(length);
            path = std::move(buffer);
            return S_OK;
        }
        buffer.resize(buffer.size() * 2);
    }
}

}  // namespace tav
