// Modules are shared objects; an HMODULE is the address at which one is
// loaded, which is what dladdr reports for any address inside it.
#include <dlfcn.h>
#include <sys/auxv.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <string>

#include "tav/com_api.h"
#include "utf.h"

namespace {

std::string ExecutablePath() {
    std::string path(256, '\0');
    for (;;) {
        ssize_t length = readlink("/proc/self/exe", path.data(), path.size());
        if (length < 0) return {};
        if (static_cast<std::size_t>(length) < path.size()) {
            path.resize(static_cast<std::size_t>(length));
            return path;
        }
        path.resize(path.size() * 2);
    }
}

HMODULE ExecutableHandle() {
    Dl_info info{};
    auto programHeaders = reinterpret_cast<const void*>(getauxval(AT_PHDR));
    if (programHeaders == nullptr || dladdr(programHeaders, &info) == 0) return nullptr;
    return info.dli_fbase;
}

// The file of the module at `module`; empty when no module is loaded there.
std::string ModuleFile(HMODULE module) {
    if (module == nullptr || module == ExecutableHandle()) return ExecutablePath();
    Dl_info info{};
    if (dladdr(module, &info) == 0 || info.dli_fbase != module || info.dli_fname == nullptr) return {};
    if (info.dli_fname[0] != '/') {
        char* resolved = realpath(info.dli_fname, nullptr);
        if (resolved != nullptr) {
            std::string path(resolved);
            free(resolved);
            return path;
        }
    }
    return info.dli_fname;
}

}  // namespace

extern "C" {

// Only the executable (a NULL name) and modules found from an address are
// known; reference counts are not kept, so the UNCHANGED_REFCOUNT flag is
// what every caller gets and the PIN flag changes nothing.
BOOL GetModuleHandleExW(DWORD dwFlags, LPCWSTR lpModuleName, HMODULE* phModule) {
    if (phModule == nullptr) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return FALSE;
    }
    *phModule = nullptr;
    if (dwFlags & GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS) {
        Dl_info info{};
        if (dladdr(lpModuleName, &info) == 0 || info.dli_fbase == nullptr) {
            SetLastError(ERROR_MOD_NOT_FOUND);
            return FALSE;
        }
        *phModule = info.dli_fbase;
        return TRUE;
    }
    if (lpModuleName == nullptr) {
        *phModule = ExecutableHandle();
        return *phModule != nullptr ? TRUE : FALSE;
    }
    SetLastError(ERROR_NOT_SUPPORTED);
    return FALSE;
}

DWORD GetModuleFileNameW(HMODULE hModule, LPWSTR lpFilename, DWORD nSize) {
    std::string file = ModuleFile(hModule);
    if (file.empty()) {
        SetLastError(ERROR_MOD_NOT_FOUND);
        return 0;
    }
    std::u16string path = tav::posix::FromUtf8(file);
    if (nSize == 0 || lpFilename == nullptr) {
        SetLastError(ERROR_INSUFFICIENT_BUFFER);
        return 0;
    }
    // As on Windows: a path that does not fit is cut, still terminated, and
    // the full buffer size is returned.
    if (path.size() >= nSize) {
        std::memcpy(lpFilename, path.data(), (nSize - 1) * sizeof(WCHAR));
        lpFilename[nSize - 1] = 0;
        SetLastError(ERROR_INSUFFICIENT_BUFFER);
        return nSize;
    }
    std::memcpy(lpFilename, path.data(), path.size() * sizeof(WCHAR));
    lpFilename[path.size()] = 0;
    return static_cast<DWORD>(path.size());
}

}  // extern "C"
